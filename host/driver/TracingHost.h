// A host that writes every call to the trace, with its arguments and its answer, and passes it on.

#pragma once

#include <string>

#include "host/driver/Trace.h"
#include "plugin/IFlashHost.h"

namespace host {

class TracingHost final : public IFlashHost {
  public:
    TracingHost(IFlashHost& next, Trace& trace) : next_(next), trace_(trace) {}

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

    const char* Reserved3() override { return next_.Reserved3(); }
    const char* Reserved5() override { return next_.Reserved5(); }
    const char* Reserved8() override { return next_.Reserved8(); }
    const char* Reserved9() override { return next_.Reserved9(); }
    const char* Reserved12() override { return next_.Reserved12(); }
    const char* Reserved13() override { return next_.Reserved13(); }
    const char* Reserved14() override { return next_.Reserved14(); }
    const char* Reserved15() override { return next_.Reserved15(); }

  private:
    /// Writes the line of a call and hands its answer on.
    const char* Answer(const std::string& call, const char* error);

    IFlashHost& next_;
    Trace& trace_;
};

}  // namespace host
