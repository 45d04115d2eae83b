// The device object of the host check: no device behind it, but a host in front. Each call of the
// interface checks the slots that a plug-in may use during it, and the call itself.

#pragma once

#include <atomic>
#include <string>
#include <utility>
#include <vector>

#include "hostcheck/Checks.h"
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
    enum class Verdict { Holds, Fails, NotChecked };
    struct Finding {
        Verdict verdict;
        std::string text;
    };

    template <typename Body>
    const char* Guarded(const char* call, Body body);

    /// The checks of a stage, in order.
    void Examine(Stage stage);
    void Note(Verdict verdict, std::string text);
    /// A finding about the call that the host is making.
    void Require(bool holds, const char* call, const char* expected, const std::string& came);
    /// Shows the findings, and how many of those that were checked hold. Throws what the host can't
    /// even be shown.
    void Tell(const char* call);
    void Show(const Finding& finding);

    CheckedHost host_;
    std::vector<Finding> findings_;
    bool initialized_ = false;
    bool loadBegun_ = false;
    std::atomic<bool> busy_ = false;
    std::atomic<bool> calledWhileBusy_ = false;
    std::string lastError_;
};

}  // namespace hostcheck
