#include "bench/LeanHost.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <numeric>

namespace bench {

namespace {

// The slots, as the interface numbers them.
enum Slot : std::uint8_t {
    GetPropertySlot = 0,
    SetPropertySlot = 1,
    LoadProgramSlot = 2,
    RunTargetSlot = 4,
    HaltTargetSlot = 6,
    ResetTargetSlot = 7,
    ReadMemorySlot = 10,
    WriteMemorySlot = 11,
    BeginProgressSlot = 16,
    UpdateProgressSlot = 17,
    EndProgressSlot = 18,
    ShowMessageSlot = 20,
    SleepSlot = 22,
};

constexpr std::uint32_t kIdentification = 0x400FE000;
constexpr std::uint32_t kCapabilities = 0x400FE008;

}  // namespace

std::uint64_t Counts::Calls() const {
    return std::accumulate(calls.begin(), calls.end(), std::uint64_t{0});
}

void NullTarget::Read(void* buffer, std::size_t count, std::uint32_t address, int,
                      std::size_t width) {
    if (width == 1) {
        std::memset(buffer, 0xFF, count);
        return;
    }
    const std::uint32_t value = address == kIdentification ? 0x10010100
                                : address == kCapabilities ? 0x00FFFFFF
                                                           : 0;
    std::memcpy(buffer, &value, sizeof value);
}

LeanHost::LeanHost(target::Target& target) : target_(target) {
    static const test::Settings ordinary = test::RecordingHost().settings;
    settings = ordinary;
}

void LeanHost::Note(Kind kind, std::uint8_t slot, const char* text, std::uint64_t address,
                    std::size_t count, std::size_t width, std::int16_t page) {
    ++counts.calls[kind];
    if (!recording) return;
    const char* kept = text == nullptr ? nullptr : texts_.insert(text).first->c_str();
    recorded.push_back({slot, static_cast<std::uint8_t>(width), page,
                        static_cast<std::uint32_t>(address), static_cast<std::uint32_t>(count),
                        kept});
}

void LeanHost::Replay() {
    std::vector<std::uint8_t> buffer(1 << 17);
    for (const auto& [slot, width, page, address, count, text] : recorded) {
        switch (slot) {
            case GetPropertySlot:
                GetProperty(text);
                break;
            case SetPropertySlot:
                SetProperty(text, "");
                break;
            case LoadProgramSlot:
                LoadProgram(text, "", "/");
                break;
            case RunTargetSlot:
                RunTarget();
                break;
            case HaltTargetSlot:
                HaltTarget();
                break;
            case ResetTargetSlot:
                ResetTarget(count != 0);
                break;
            case ReadMemorySlot:
                ReadMemory(buffer.data(), count, address, page, width);
                break;
            case WriteMemorySlot:
                WriteMemory(buffer.data(), count, address, page, width);
                break;
            case BeginProgressSlot:
                BeginProgress(text);
                break;
            case UpdateProgressSlot:
                UpdateProgress(count, text);
                break;
            case EndProgressSlot:
                EndProgress();
                break;
            case ShowMessageSlot:
                ShowMessage(text);
                break;
            case SleepSlot:
                Sleep(count);
                break;
        }
    }
}

const char* LeanHost::GetProperty(const char* name) {
    Note(Settings, GetPropertySlot, name);
    return settings.at(name).c_str();
}

const char* LeanHost::SetProperty(const char* name, const char* value) {
    Note(Settings, SetPropertySlot, name);
    settings[name] = value;
    return nullptr;
}

const char* LeanHost::LoadProgram(const char* fileName, const char*, const char* directory) {
    Note(Control, LoadProgramSlot, fileName);
    target_.LoadProgram(fileName, directory);
    return nullptr;
}

const char* LeanHost::RunTarget() {
    Note(Control, RunTargetSlot);
    target_.Run();
    return nullptr;
}

const char* LeanHost::HaltTarget() {
    Note(Control, HaltTargetSlot);
    target_.Halt();
    return nullptr;
}

const char* LeanHost::ResetTarget(bool flag) {
    Note(Control, ResetTargetSlot, nullptr, 0, flag ? 1 : 0);
    target_.Reset(flag);
    return nullptr;
}

const char* LeanHost::ReadMemory(void* buffer, size_t count, uint64_t address, int16_t page,
                                 size_t width) {
    Note(Reads, ReadMemorySlot, nullptr, address, count, width, page);
    counts.bytesRead += count * width;
    target_.Read(buffer, count, static_cast<std::uint32_t>(address), page, width);
    return nullptr;
}

const char* LeanHost::WriteMemory(const void* buffer, size_t count, uint64_t address, int16_t page,
                                  size_t width) {
    Note(Writes, WriteMemorySlot, nullptr, address, count, width, page);
    counts.bytesWritten += count * width;
    target_.Write(buffer, count, static_cast<std::uint32_t>(address), page, width);
    return nullptr;
}

const char* LeanHost::BeginProgress(const char* title) {
    Note(Display, BeginProgressSlot, title);
    return nullptr;
}

const char* LeanHost::UpdateProgress(uint32_t percent, const char* text) {
    Note(Display, UpdateProgressSlot, text, 0, percent);
    return nullptr;
}

const char* LeanHost::EndProgress() {
    Note(Display, EndProgressSlot);
    return nullptr;
}

const char* LeanHost::ShowMessage(const char* text) {
    Note(Display, ShowMessageSlot, text);
    return nullptr;
}

// A figure for work that failed would mean nothing.
const char* LeanHost::ShowError(const char* text) {
    std::fprintf(stderr, "The work to be measured failed: %s\n", text);
    std::abort();
}

const char* LeanHost::Sleep(uint32_t milliseconds) {
    Note(Pauses, SleepSlot, nullptr, 0, milliseconds);
    counts.pausedMs += milliseconds;
    target_.Pause(milliseconds);
    return nullptr;
}

}  // namespace bench
