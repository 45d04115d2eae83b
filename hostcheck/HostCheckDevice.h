// The device object of the host check: no device behind it, but a host in front. Each call of the
// interface checks the slots that a plug-in may use during it, and the call itself.

#pragma once

#include <atomic>
#include <initializer_list>
#include <string>

#include "hostcheck/Checks.h"
#include "hostcheck/LoadSequence.h"
#include "hostcheck/Report.h"
#include "plugin/IFlashDevice2.h"

namespace hostcheck {

class HostCheckDevice final : public IFlashDevice2 {
  public:
    /// Checks what may be checked before there is anybody to tell; Initialize tells it.
    HostCheckDevice(const char* variant, const char* text2, const char* text3, IFlashHost* host);
    HostCheckDevice(const HostCheckDevice&) = delete;
    HostCheckDevice& operator=(const HostCheckDevice&) = delete;
    virtual ~HostCheckDevice() = default;

    const char* Initialize(bool* flashAvailable, const char** operations) override;
    const char* AddressWithinFlash(uint64_t address, bool* within) override;
    const char* AddressWithinFlash(uint64_t address, int32_t size, bool* within) override;
    const char* WriteDataToFlash(const uint16_t* data, uint64_t address, uint32_t length,
                                 int16_t page) override;
    const char* WriteDataToFlash(const unsigned char* data, uint64_t address, uint32_t length,
                                 int16_t page) override;
    const char* PerformOperation(const char* operation) override;
    const char* ResetSettings(int32_t mode) override;
    const char* AddressWithinSpecialRegion(uint64_t address, bool* result) override;
    void Destroy() override;

  private:
    template <typename Body>
    const char* Guarded(const char* call, Body body);

    /// The checks of these stages, and what they can't see. `call` is what the host has called.
    void Examine(const char* call, std::initializer_list<Stage> stages, const char* unseen);
    void Run(const Check& check);

    /// A finding about the call that the host is making.
    void Require(bool holds, const std::string& call, const std::string& expected,
                 const std::string& came);
    void RequireSection(const void* data, std::uint32_t address, std::uint32_t length);
    void CheckNamedOperation(const std::string& name);
    /// What of the whole has not been run with this device object.
    std::string NotRunYet() const;

    CheckedHost host_;
    Report report_;
    LoadSequence load_;
    bool displaysChecked_ = false;
    bool loaderChecked_ = false;
    std::atomic<bool> busy_ = false;
    std::atomic<bool> calledWhileBusy_ = false;
    std::string lastError_;
};

}  // namespace hostcheck
