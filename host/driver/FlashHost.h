// The host's side of the plug-in interface: target access, settings, messages and progress, with a
// memory of what was shown and a check that the plug-in keeps to the protocol.

#pragma once

#include <functional>
#include <string>
#include <utility>
#include <vector>

#include "host/driver/FlashWatch.h"
#include "host/driver/RegisterWatch.h"
#include "host/output/Reporter.h"
#include "host/settings/SettingStore.h"
#include "plugin/IFlashHost.h"
#include "target/Target.h"

namespace host {

class FlashHost final : public IFlashHost {
  public:
    FlashHost(target::Target& target, SettingStore& settings, Reporter& reporter, FlashWatch& watch,
              std::string directory);

    FlashHost(const FlashHost&) = delete;
    FlashHost& operator=(const FlashHost&) = delete;

    /// Errors that the plug-in has shown, or that it has made, since the object was created.
    const std::vector<std::string>& Errors() const { return errors_; }

    /// The level at which the plug-in's messages are shown; errors are always shown.
    void SetMessageLevel(Verbosity level) { messageLevel_ = level; }

    /// Asked before anything is shown that the plug-in may have read; false keeps it back.
    void SetConfirm(std::function<bool()> confirm) { confirm_ = std::move(confirm); }

    /// Whether anything was read that ReadsConfirmed hasn't been called for.
    bool HasUnconfirmedReads() const { return unconfirmedReads_; }
    void NoteRead() { unconfirmedReads_ = true; }  ///< not by a slot
    void ReadsConfirmed() { unconfirmedReads_ = false; }

    /// To be called around each call into the plug-in: what an earlier one left doesn't count for
    /// it, and no display may be open when it returns.
    void CallBegins();
    void CallReturned();

    /// Why the first slot of the call that failed did so: the plug-in shows texts of its own.
    const std::string& FirstFailure() const { return firstFailure_; }

    /// From now on accesses are carried out after Ctrl-C as well, to end the work in order.
    void BeginClosing() { closing_ = true; }

    const RegisterWatch& Registers() const { return registers_; }

    const char* GetProperty(const char* name) override;
    const char* SetProperty(const char* name, const char* value) override;
    const char* LoadProgram(const char* fileName, const char* second,
                            const char* directory) override;
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
    const char* GetDirectory() override;
    const char* Sleep(uint32_t milliseconds) override;

    const char* Reserved3() override { return nullptr; }
    const char* Reserved5() override { return nullptr; }
    const char* Reserved8() override { return nullptr; }
    const char* Reserved9() override { return nullptr; }
    const char* Reserved12() override { return nullptr; }
    const char* Reserved13() override { return nullptr; }
    const char* Reserved14() override { return nullptr; }
    const char* Reserved15() override { return nullptr; }

  private:
    /// When a slot still does its work after Ctrl-C: what ends the work in order goes on.
    enum class AfterInterrupt { Refuse, GoOn };

    template <typename Action>
    const char* Slot(AfterInterrupt after, Action&& action) noexcept;
    void BreachOfProtocol(const std::string& what);
    bool MayTell() const { return !confirm_ || confirm_(); }

    target::Target& target_;
    SettingStore& settings_;
    Reporter& reporter_;
    FlashWatch& watch_;
    std::string directory_;
    std::string property_;   ///< what GetProperty handed out last
    std::string errorText_;  ///< what a failing slot returned last
    std::string firstFailure_;
    std::string publishedMac_;
    std::vector<std::string> errors_;
    RegisterWatch registers_;
    std::function<bool()> confirm_;
    bool unconfirmedReads_ = false;
    Verbosity messageLevel_ = Verbosity::Normal;
    bool closing_ = false;
    bool displayOpen_ = false;
};

}  // namespace host
