// A host that obeys the contract and otherwise answers whatever a byte string says: error texts,
// unknown settings, any register value. Once the bytes are used up, it answers as an ordinary host.

#pragma once

#include <map>
#include <memory>
#include <string>

#include "fuzz/Require.h"
#include "tests/support/RecordingHost.h"
#include "tests/support/StrictHost.h"

/// Takes numbers and texts from a byte string; from its end on, zeros and empty texts.
class ByteSource {
  public:
    ByteSource(const std::uint8_t* begin, const std::uint8_t* end) : at_(begin), end_(end) {}

    bool Empty() const { return at_ == end_; }
    std::uint8_t Byte() { return Empty() ? std::uint8_t{0} : *at_++; }
    std::uint32_t Word();
    std::string Text();

    /// The first bytes as a source of their own.
    ByteSource Split(std::size_t size);

  private:
    const std::uint8_t* at_;
    const std::uint8_t* end_;
};

class FuzzHost final : public test::StrictHost {
  public:
    /// After so much work, in calls and kilobytes, the connection is lost: every call fails. Each
    /// call into the plug-in may then make so many more.
    static constexpr std::size_t kWorkUntilLost = 300;
    static constexpr int kCallsToNotice = 32;

    explicit FuzzHost(ByteSource answers);
    ~FuzzHost();

    test::Settings settings;
    std::map<std::uint32_t, std::uint32_t> registers;
    int errorsShown = 0;

    /// What must hold whenever the plug-in returns.
    void CallReturned();

    /// Answers as an ordinary host from now on.
    void BecomeOrdinary();

    const char* GetProperty(const char* name) override;
    const char* SetProperty(const char* name, const char* value) override;
    const char* LoadProgram(const char*, const char*, const char*) override;
    const char* RunTarget() override { return Answer(); }
    const char* HaltTarget() override { return Answer(); }
    const char* ResetTarget(bool) override { return Answer(); }
    const char* ReadMemory(void*, size_t count, uint64_t address, int16_t, size_t width) override;
    const char* WriteMemory(const void*, size_t count, uint64_t address, int16_t,
                            size_t width) override;
    const char* BeginProgress(const char* title) override;
    const char* UpdateProgress(uint32_t percent, const char* text) override;
    const char* EndProgress() override;
    const char* ShowError(const char* text) override;
    const char* ShowMessage(const char* text) override { return Answer(text); }
    const char* GetDirectory() override { return Kept("C:\\host\\"); }
    const char* Sleep(uint32_t) override { return Answer(); }

  private:
    const char* Answer(const char* text = "");
    const char* Kept(std::string text);
    bool IsLost(std::size_t work = 1);

    ByteSource answers_;
    std::size_t work_ = 0;
    int callsSinceLost_ = 0;
    int openDisplays_ = 0;
    std::unique_ptr<std::string> kept_;  ///< freed by the next call, so that no stale use hides
};
