#include "bench/support/LeanHost.h"

#include <cstring>
#include <numeric>

namespace test {

using enum CallKind;

std::uint64_t Counts::Calls() const {
    return std::accumulate(calls.begin(), calls.end(), std::uint64_t{0});
}

void NullTarget::Read(void* buffer, std::size_t count, std::uint32_t address, int,
                      std::size_t width) {
    if (width == 1) {
        std::memset(buffer, 0xFF, count);
        return;
    }
    const std::uint32_t value = address == 0x400FE000   ? 0x10010100  // identification
                                : address == 0x400FE008 ? 0x00FFFFFF  // capabilities
                                                        : 0;
    std::memcpy(buffer, &value, sizeof value);
}

LeanHost::LeanHost(target::Target& target) : settings(OrdinarySettings()), target_(target) {}

const char* LeanHost::GetProperty(const char* name) {
    Note({Setting, 0, name});
    return settings.at(name).c_str();
}

const char* LeanHost::SetProperty(const char* name, const char* value) {
    settings[name] = value;
    return Note({Setting, 1, name});
}

const char* LeanHost::LoadProgram(const char* fileName, const char*, const char* directory) {
    target_.LoadProgram(fileName, directory);
    return Note({Control, 2, fileName});
}

const char* LeanHost::RunTarget() {
    target_.Run();
    return Note({Control, 4});
}

const char* LeanHost::HaltTarget() {
    target_.Halt();
    return Note({Control, 6});
}

const char* LeanHost::ResetTarget(bool flag) {
    target_.Reset(flag);
    return Note({Control, 7, nullptr, flag});
}

const char* LeanHost::ReadMemory(void* buffer, size_t count, uint64_t address, int16_t page,
                                 size_t width) {
    const auto at = static_cast<std::uint32_t>(address);
    counts.bytesRead += count * width;
    target_.Read(buffer, count, at, page, width);
    return Note({Read, 10, nullptr, 0, at, count, page, width});
}

const char* LeanHost::WriteMemory(const void* buffer, size_t count, uint64_t address, int16_t page,
                                  size_t width) {
    const auto at = static_cast<std::uint32_t>(address);
    counts.bytesWritten += count * width;
    target_.Write(buffer, count, at, page, width);
    return Note({Write, 11, nullptr, 0, at, count, page, width});
}

const char* LeanHost::BeginProgress(const char* title) {
    return Note({Display, 16, title});
}

const char* LeanHost::UpdateProgress(uint32_t percent, const char* text) {
    return Note({Display, 17, text, percent});
}

const char* LeanHost::EndProgress() {
    return Note({Display, 18});
}

const char* LeanHost::ShowMessage(const char* text) {
    return Note({Display, 20, text});
}

// A figure for work that failed would mean nothing.
const char* LeanHost::ShowError(const char* text) {
    std::fprintf(stderr, "The work to be measured failed: %s\n", text);
    std::abort();
}

const char* LeanHost::Sleep(uint32_t milliseconds) {
    counts.pausedMs += milliseconds;
    target_.Pause(std::chrono::milliseconds(milliseconds));
    return Note({Pause, 22, nullptr, milliseconds});
}

}  // namespace test
