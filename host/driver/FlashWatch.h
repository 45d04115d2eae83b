// What is known of the flash from the accesses that go by in the host's slots: what was begun, how
// far it got, and what was seen to be done. The plug-in reports progress for what it reads back
// only; sectors erased and chunks programmed are seen here, and put onto the meter.

#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>

#include "base/AddressSet.h"
#include "host/output/WorkMeter.h"
#include "host/targets/LoaderWait.h"

namespace host {

/// A byte that a blank check has found not to be erased.
struct NotBlank {
    std::uint32_t address = 0;
    std::uint8_t actual = 0;
};

/// What a run has done to the flash, so far as it can know. Nothing outside `attempted` has
/// changed.
struct FlashWork {
    base::AddressSet
        attempted;  ///< the access that erases or programs it went out, and perhaps arrived
    base::AddressSet erased;      ///< the flash controller was seen to be done
    base::AddressSet handedOver;  ///< arrived at the loader
    base::AddressSet programmed;  ///< the loader was seen to be done, and no erase had failed
};

class FlashWatch final : public LoaderObserver {
  public:
    explicit FlashWatch(WorkMeter& meter) : meter_(meter) {}

    void SetGeometry(std::uint64_t flashBytes, std::uint32_t sectorBytes);

    void ProgramLoaded();

    /// Before a write goes out, for one whose answer is lost may have arrived.
    void Writing(std::uint32_t address, std::uint32_t word);
    void Read(std::uint32_t address, std::size_t bytes, const std::uint8_t* data);

    void HandingOver(const base::AddressRange& chunk) override { work_.attempted.Add(chunk); }
    void HandedOver(const base::AddressRange& chunk) override { work_.handedOver.Add(chunk); }
    void Programmed(const base::AddressRange& chunk) override;
    void StillAtWork(const base::AddressRange& chunk, std::chrono::seconds limit) override;

    /// The plug-in goes on with a load after an erase that failed, and then nobody knows what the
    /// flash controller makes of it.
    void SlotFailed();

    void DisplayBegan(const std::string& title);
    void DisplayEnded();

    const std::optional<NotBlank>& FirstNotBlank() const { return notBlank_; }

    const FlashWork& Work() const { return work_; }

    /// Whether anything was begun that changes flash.
    bool FlashTouched() const { return !work_.attempted.Empty(); }

    /// The same, or a user register was committed: what the device keeps without power may differ.
    bool ContentsTouched() const { return commanded_ || FlashTouched(); }

  private:
    void NoteCommand(std::uint32_t command);
    void FinishErase(std::uint32_t commandRegister);

    WorkMeter& meter_;
    std::uint64_t flashBytes_ = 0;
    std::uint32_t sectorBytes_ = 0;
    FlashWork work_;
    std::uint32_t addressRegister_ = 0;
    std::uint32_t pendingErase_ = 0;  ///< command bits of an erase that is under way
    base::AddressRange erasing_;      ///< what it erases
    bool eraseFailed_ = false;        ///< the last one
    bool commanded_ = false;
    bool displayOpen_ = false;
    std::optional<NotBlank> notBlank_;
};

}  // namespace host
