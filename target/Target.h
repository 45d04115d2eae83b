// Target: what a host drives, whether a board behind a probe or a simulation.
//
// It knows nothing of flash programming. Addresses are byte addresses; a transfer moves `count`
// elements of `width` bytes (1, 2 or 4); `page` numbers the target's memory space.

#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <optional>
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

    /// Lets so much of the target's time pass.
    virtual void Pause(std::chrono::nanoseconds time) = 0;

    /// Whether a pause lets simulated time pass, so that nobody has to wait for it.
    virtual bool SimulatesTime() const { return false; }

    /// Whether an access to the running target stops it. Whoever waits for it then looks seldom,
    /// and when all that it waits for should be done.
    virtual bool StopsForReads() const { return false; }

    /// Whether a read that has failed may look like one that was answered.
    virtual bool HidesFailedReads() const { return false; }

    /// The CRC-32 of so many bytes at an address (base/Crc32.h), summed up where they are, without
    /// moving them; nothing where nobody can do that, or where it isn't known that whoever does it
    /// does it right. The target is halted.
    virtual std::optional<std::uint32_t> Checksum(std::uint32_t /*address*/,
                                                  std::uint32_t /*sizeBytes*/) {
        return std::nullopt;
    }

    /// Whether the running target was stopped by an access and hasn't gone on yet. Until a pause,
    /// or a look that finds its program busy, lets it go on, looks cost nothing more.
    virtual bool StandsStill() const { return false; }

    /// How long the target's program has run since some fixed moment: without the time during
    /// which it was stopped for an access. It doesn't grow while the target stands still.
    virtual std::chrono::nanoseconds RanFor() const { return Now(); }
};

}  // namespace target
