#include "tests/support/LeanHost.h"

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
    Note({Setting, 1, name});
    settings[name] = value;
    return nullptr;
}

const char* LeanHost::LoadProgram(const char* fileName, const char*, const char* directory) {
    Note({Control, 2, fileName});
    target_.LoadProgram(fileName, directory);
    return nullptr;
}

const char* LeanHost::RunTarget() {
    Note({Control, 4});
    target_.Run();
    return nullptr;
}

const char* LeanHost::HaltTarget() {
    Note({Control, 6});
    target_.Halt();
    return nullptr;
}

const char* LeanHost::ResetTarget(bool flag) {
    Note({Control, 7, nullptr, flag});
    target_.Reset(flag);
    return nullptr;
}

const char* LeanHost::ReadMemory(void* buffer, size_t count, uint64_t address, int16_t page,
                                 size_t width) {
    const auto at = static_cast<std::uint32_t>(address);
    Note({Read, 10, nullptr, 0, at, count, page, width});
    counts.bytesRead += count * width;
    target_.Read(buffer, count, at, page, width);
    return nullptr;
}

const char* LeanHost::WriteMemory(const void* buffer, size_t count, uint64_t address, int16_t page,
                                  size_t width) {
    const auto at = static_cast<std::uint32_t>(address);
    Note({Write, 11, nullptr, 0, at, count, page, width});
    counts.bytesWritten += count * width;
    target_.Write(buffer, count, at, page, width);
    return nullptr;
}

const char* LeanHost::BeginProgress(const char* title) {
    Note({Display, 16, title});
    return nullptr;
}

const char* LeanHost::UpdateProgress(uint32_t percent, const char* text) {
    Note({Display, 17, text, percent});
    return nullptr;
}

const char* LeanHost::EndProgress() {
    Note({Display, 18});
    return nullptr;
}

const char* LeanHost::ShowMessage(const char* text) {
    Note({Display, 20, text});
    return nullptr;
}

// A figure for work that failed would mean nothing.
const char* LeanHost::ShowError(const char* text) {
    std::fprintf(stderr, "The work to be measured failed: %s\n", text);
    std::abort();
}

const char* LeanHost::Sleep(uint32_t milliseconds) {
    Note({Pause, 22, nullptr, milliseconds});
    counts.pausedMs += milliseconds;
    target_.Pause(milliseconds);
    return nullptr;
}

}  // namespace test
