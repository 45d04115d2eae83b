// What is known of the flash from the accesses that go by in the host's slots. The plug-in reports
// progress for what it reads back only; sectors erased and chunks programmed are seen here, and put
// onto the meter.

#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>

#include "host/output/WorkMeter.h"

namespace host {

/// A byte that a blank check has found not to be erased.
struct NotBlank {
    std::uint32_t address = 0;
    std::uint8_t actual = 0;
};

class FlashWatch {
  public:
    explicit FlashWatch(WorkMeter& meter) : meter_(meter) {}

    void SetGeometry(std::uint64_t flashBytes, std::uint32_t sectorBytes);

    void ProgramLoaded();
    void Wrote(std::uint32_t address, std::size_t bytes, std::uint32_t word);
    void Read(std::uint32_t address, std::size_t bytes, const std::uint8_t* data);
    void DisplayBegan(const std::string& title);
    void DisplayEnded();

    const std::optional<NotBlank>& FirstNotBlank() const { return notBlank_; }

    /// Whether anything was begun that changes flash.
    bool FlashTouched() const { return flashTouched_; }

    /// The same, or a user register was committed: what the device keeps without power may differ.
    bool ContentsTouched() const { return contentsTouched_; }

  private:
    void BeginErase(std::uint32_t command);
    void FinishErase(std::uint32_t commandRegister);

    WorkMeter& meter_;
    std::uint64_t flashBytes_ = 0;
    std::uint32_t sectorBytes_ = 0;
    std::uint32_t pendingErase_ = 0;  ///< command bits of an erase that is under way
    bool displayOpen_ = false;
    bool flashTouched_ = false;
    bool contentsTouched_ = false;
    std::optional<NotBlank> notBlank_;
};

}  // namespace host
