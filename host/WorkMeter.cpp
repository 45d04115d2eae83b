// See WorkMeter.h.

#include "host/WorkMeter.h"

#include <algorithm>
#include <string_view>

namespace host {

namespace {

// The flash command register takes an erase command in its low bits, under a key in the high half,
// and shows the same bit until the erase is done.
constexpr std::uint32_t kCommandRegister = 0x400FD008;
constexpr std::uint32_t kEraseSector = 0x2;
constexpr std::uint32_t kEraseAll = 0x4;

// The loader's two chunk buffers lie one behind the other.
constexpr std::uint32_t kLoaderBuffers = 0x20000000;
constexpr std::uint32_t kLoaderBuffersEnd = 0x20001000;

constexpr struct {
    std::string_view title;
    Phase phase;
} kDisplays[] = {
    {"Erasing Flash.", Phase::Erase},
    {"Performing Blank Check", Phase::BlankCheck},
    {"CRC Calculation", Phase::Checksum},
};

}  // namespace

void WorkMeter::SetGeometry(std::uint64_t flashSize, std::uint32_t sectorSize) {
    flashSize_ = flashSize;
    sectorSize_ = sectorSize;
}

void WorkMeter::Expect(Phase phase, std::uint64_t bytes) {
    At(phase).totalBytes += bytes;
}

void WorkMeter::ProgramLoaded() {
    Begin(Phase::Program);
    flashTouched_ = contentsTouched_ = true;
}

void WorkMeter::Wrote(std::uint32_t address, std::size_t bytes, std::uint32_t word) {
    contentsTouched_ = contentsTouched_ || address == kCommandRegister;
    if (address == kCommandRegister) BeginErase(word);
    if (current_ == Phase::Program && address >= kLoaderBuffers && address < kLoaderBuffersEnd)
        Advance(bytes);
}

void WorkMeter::Read(std::uint32_t address, std::size_t bytes, const std::uint8_t* data) {
    if (address == kCommandRegister && bytes == 4) FinishErase(data[0]);
    if (!displayOpen_ || (current_ != Phase::BlankCheck && current_ != Phase::Checksum)) return;
    if (current_ == Phase::BlankCheck && !notBlank_) {
        const auto* found =
            std::find_if(data, data + bytes, [](std::uint8_t byte) { return byte != 0xFF; });
        if (found != data + bytes)
            notBlank_ = {address + static_cast<std::uint32_t>(found - data), *found};
    }
    Advance(bytes);
}

void WorkMeter::BeginErase(std::uint32_t command) {
    pendingErase_ = command & (kEraseSector | kEraseAll);
    if (pendingErase_ == 0) return;
    Begin(Phase::Erase);
    flashTouched_ = true;
}

void WorkMeter::FinishErase(std::uint32_t commandRegister) {
    if (pendingErase_ == 0 || (commandRegister & pendingErase_) != 0) return;
    Advance(pendingErase_ == kEraseAll ? flashSize_ : sectorSize_);
    pendingErase_ = 0;
}

void WorkMeter::DisplayBegan(const std::string& title) {
    displayOpen_ = true;
    for (const auto& display : kDisplays)
        if (display.title == title) Begin(display.phase);
}

void WorkMeter::DisplayEnded() {
    displayOpen_ = false;
    End();
}

void WorkMeter::Begin(Phase phase) {
    TakeTime();
    current_ = phase;
    since_ = Clock::now();
    reporter_.Progress(phase, At(phase));
}

void WorkMeter::Advance(std::uint64_t bytes) {
    if (!current_) return;
    TakeTime();
    PhaseProgress& progress = At(*current_);
    progress.doneBytes += bytes;
    // More work than was announced: the total grows with it rather than be wrong.
    if (progress.totalBytes != 0)
        progress.totalBytes = std::max(progress.totalBytes, progress.doneBytes);
    reporter_.Progress(*current_, progress);
}

void WorkMeter::End() {
    TakeTime();
    current_.reset();
}

void WorkMeter::TakeTime() {
    if (!current_) return;
    const auto now = Clock::now();
    At(*current_).seconds += std::chrono::duration<double>(now - since_).count();
    since_ = now;
}

}  // namespace host
