// Target: what a host drives, whether a board behind a probe or a simulation.
//
// It knows nothing of flash programming. Addresses are byte addresses; a transfer moves `count`
// elements of `width` bytes (1, 2 or 4); `page` numbers the target's memory space.

#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <stdexcept>
#include <string>

namespace target {

/// Any failure of a target access. The text says what was tried, where, and why it failed.
class TargetError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

class Target {
  public:
    virtual ~Target() = default;

    virtual void Read(void* buffer, std::size_t count, std::uint32_t address, int page,
                      std::size_t width) = 0;
    virtual void Write(const void* buffer, std::size_t count, std::uint32_t address, int page,
                       std::size_t width) = 0;

    /// Loads a target-side program, named by its file name and the directory it lies in, into
    /// the halted target, ready for Run.
    virtual void LoadProgram(const std::string& fileName, const std::string& directory) = 0;

    virtual void Run() = 0;
    virtual void Halt() = 0;

    /// Resets the target and leaves it halted.
    virtual void Reset(bool flag) = 0;

    /// The target's time since some fixed moment: the machine's, unless the target is simulated.
    virtual std::chrono::nanoseconds Now() const {
        return std::chrono::steady_clock::now().time_since_epoch();
    }

    /// Lets `milliseconds` of the target's time pass.
    virtual void Pause(std::uint32_t milliseconds) = 0;

    /// Whether a pause lets simulated time pass, so that nobody has to wait for it.
    virtual bool SimulatesTime() const { return false; }

    /// Whether an access to the running target stops it for a moment. Then it doesn't go on while
    /// it is looked at: whoever waits for it looks first when it should be done, reads all that it
    /// wants to know at once, and waits by Pause, which lets it go on.
    virtual bool LooksStopIt() const { return false; }

    /// Whether a read that has failed may look like one that was answered.
    virtual bool HidesFailedReads() const { return false; }
};

}  // namespace target
