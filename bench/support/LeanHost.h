// The least that a host can be: it forwards to a target and counts. What a run costs beyond this
// host is the plug-in's own.

#pragma once

#include <array>

#include "target/Target.h"
#include "tests/support/RecordingHost.h"

namespace test {

/// Host calls by what they are for.
enum class CallKind : std::uint8_t { Setting, Read, Write, Control, Pause, Display, Count };

/// One call, with all that it takes to make it again. The number is a percentage, a pause in
/// milliseconds or a flag.
struct Call {
    CallKind kind;
    std::uint8_t slot;
    const char* text = nullptr;  ///< valid during the call
    std::uint32_t number = 0;
    std::uint32_t address = 0;
    std::size_t count = 0;
    std::int16_t page = 0;
    std::size_t width = 0;
};

struct Counts {
    std::array<std::uint64_t, static_cast<std::size_t>(CallKind::Count)> calls{};
    std::uint64_t bytesRead = 0;
    std::uint64_t bytesWritten = 0;
    std::uint64_t pausedMs = 0;

    std::uint64_t Calls() const;
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
    void Pause(std::chrono::nanoseconds) override {}
};

class LeanHost : public StrictHost {
  public:
    explicit LeanHost(target::Target& target);
    virtual ~LeanHost() = default;

    Settings settings;
    Counts counts;

    const char* GetProperty(const char* name) final;
    const char* SetProperty(const char* name, const char* value) final;
    const char* LoadProgram(const char* fileName, const char*, const char* directory) final;
    const char* RunTarget() final;
    const char* HaltTarget() final;
    const char* ResetTarget(bool flag) final;
    const char* ReadMemory(void* buffer, size_t count, uint64_t address, int16_t page,
                           size_t width) final;
    const char* WriteMemory(const void* buffer, size_t count, uint64_t address, int16_t page,
                            size_t width) final;
    const char* BeginProgress(const char* title) final;
    const char* UpdateProgress(uint32_t percent, const char* text) final;
    const char* EndProgress() final;
    const char* ShowError(const char* text) final;
    const char* ShowMessage(const char* text) final;
    const char* GetDirectory() final { return "/"; }
    const char* Sleep(uint32_t milliseconds) final;

  protected:
    /// Counts a call; returns null, as a call that succeeds.
    virtual const char* Note(const Call& call) {
        ++counts.calls[static_cast<std::size_t>(call.kind)];
        return nullptr;
    }

  private:
    target::Target& target_;
};

}  // namespace test
