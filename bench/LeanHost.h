// The least that a host can be: it forwards to a target, counts, and remembers its calls on
// request. What a run costs beyond this host is the plug-in's own.

#pragma once

#include <array>
#include <cstdint>
#include <set>
#include <string>
#include <vector>

#include "target/Target.h"
#include "tests/support/RecordingHost.h"
#include "tests/support/StrictHost.h"

namespace bench {

/// Host calls by what they are for.
enum Kind { Settings, Reads, Writes, Control, Pauses, Display, KindCount };

struct Counts {
    std::array<std::uint64_t, KindCount> calls{};
    std::uint64_t bytesRead = 0;
    std::uint64_t bytesWritten = 0;
    std::uint64_t pausedMs = 0;

    std::uint64_t Calls() const;
};

/// One call, with all that it takes to make it again.
struct Call {
    std::uint8_t slot;
    std::uint8_t width;
    std::int16_t page;
    std::uint32_t address;
    std::uint32_t count;
    const char* text;
};

/// A target that keeps nothing and is always ready: registers read 0, so that commands and chunks
/// are done at once, and memory reads as erased. A Tolva with as much flash as one can have.
class NullTarget final : public target::Target {
  public:
    void Read(void* buffer, std::size_t count, std::uint32_t address, int page,
              std::size_t width) override;
    void Write(const void*, std::size_t, std::uint32_t, int, std::size_t) override {}
    void LoadProgram(const std::string&, const std::string&) override {}
    void Run() override {}
    void Halt() override {}
    void Reset(bool) override {}
    void Pause(std::uint32_t) override {}
};

class LeanHost final : public test::StrictHost {
  public:
    explicit LeanHost(target::Target& target);

    test::Settings settings;
    Counts counts;
    bool recording = false;
    std::vector<Call> recorded;

    /// Makes the recorded calls once more, without a plug-in.
    void Replay();

    const char* GetProperty(const char* name) override;
    const char* SetProperty(const char* name, const char* value) override;
    const char* LoadProgram(const char* fileName, const char*, const char* directory) override;
    const char* RunTarget() override;
    const char* HaltTarget() override;
    const char* ResetTarget(bool flag) override;
    const char* ReadMemory(void* buffer, size_t count, uint64_t address, int16_t page,
                           size_t width) override;
    const char* WriteMemory(const void* buffer, size_t count, uint64_t address, int16_t page,
                            size_t width) override;
    const char* BeginProgress(const char* title) override;
    const char* UpdateProgress(uint32_t percent, const char* text) override;
    const char* EndProgress() override;
    const char* ShowError(const char* text) override;
    const char* ShowMessage(const char* text) override;
    const char* GetDirectory() override { return "/"; }
    const char* Sleep(uint32_t milliseconds) override;

  private:
    void Note(Kind kind, std::uint8_t slot, const char* text = nullptr, std::uint64_t address = 0,
              std::size_t count = 0, std::size_t width = 1, std::int16_t page = 0);

    target::Target& target_;
    std::set<std::string> texts_;  ///< of the recorded calls
};

}  // namespace bench
