// Reading the plug-in's work off its register accesses, transfers and displays.

#include "host/driver/FlashWatch.h"

#include <fmt/format.h>

#include <algorithm>
#include <string_view>

#include "host/base/Text.h"
#include "host/facts/FlashMemory.h"
#include "host/facts/Operations.h"

namespace host {

namespace {

constexpr struct {
    std::string_view title;
    Phase phase;
} kDisplays[] = {
    {plugin::kEraseTitle, Phase::Erase},
    {plugin::kBlankCheckTitle, Phase::BlankCheck},
    {plugin::kChecksumTitle, Phase::Checksum},
};

}  // namespace

void FlashWatch::SetGeometry(std::uint64_t flashBytes, std::uint32_t sectorBytes) {
    flashBytes_ = flashBytes;
    sectorBytes_ = sectorBytes;
}

void FlashWatch::ProgramLoaded() {
    meter_.Begin(Phase::Program);
}

void FlashWatch::Writing(std::uint32_t address, std::uint32_t word) {
    if (address == plugin::kFlashAddressRegister) addressRegister_ = word;
    if (address == plugin::kFlashCommandRegister) NoteCommand(word);
}

void FlashWatch::Programmed(const base::AddressRange& chunk) {
    if (eraseFailed_ || pendingErase_ != 0) return;
    work_.programmed.Add(chunk);
    if (meter_.Running() == Phase::Program) meter_.Advance(chunk.Size());
}

void FlashWatch::Read(std::uint32_t address, std::size_t bytes, const std::uint8_t* data) {
    if (address == plugin::kFlashCommandRegister && bytes == 4) FinishErase(data[0]);
    const auto running = meter_.Running();
    if (!displayOpen_ || (running != Phase::BlankCheck && running != Phase::Checksum)) return;
    if (running == Phase::BlankCheck && !notBlank_) {
        const auto* found =
            std::find_if(data, data + bytes, [](std::uint8_t byte) { return byte != 0xFF; });
        if (found != data + bytes)
            notBlank_ = {address + static_cast<std::uint32_t>(found - data), *found};
    }
    meter_.Advance(bytes);
}

void FlashWatch::StillAtWork(const base::AddressRange& chunk, std::chrono::seconds limit) {
    meter_.Say(fmt::format("Waiting for the loader to finish {}, up to {} s", RangeText(chunk),
                           limit.count()));
}

void FlashWatch::SlotFailed() {
    if (meter_.Running() == Phase::Erase) eraseFailed_ = true;
}

void FlashWatch::NoteCommand(std::uint32_t command) {
    commanded_ = true;
    eraseFailed_ = false;
    pendingErase_ = command & (plugin::kEraseSectorBit | plugin::kEraseAllBit);
    if (pendingErase_ == 0) return;
    const auto last = static_cast<std::uint32_t>(flashBytes_ - 1);
    erasing_ = pendingErase_ == plugin::kEraseAllBit
                   ? base::AddressRange{0, last}
                   : base::AddressRange{addressRegister_,
                                        std::min(addressRegister_ + (sectorBytes_ - 1), last)};
    work_.attempted.Add(erasing_);
    meter_.Begin(Phase::Erase);
}

void FlashWatch::FinishErase(std::uint32_t commandRegister) {
    if (pendingErase_ == 0 || (commandRegister & pendingErase_) != 0) return;
    work_.erased.Add(erasing_);
    meter_.Advance(erasing_.Size());
    pendingErase_ = 0;
}

void FlashWatch::DisplayBegan(const std::string& title) {
    displayOpen_ = true;
    for (const auto& display : kDisplays)
        if (display.title == title) meter_.Begin(display.phase);
}

void FlashWatch::DisplayEnded() {
    displayOpen_ = false;
    meter_.End();
}

}  // namespace host
