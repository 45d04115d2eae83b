#include "plugin/HostAccess.h"

#include <bit>
#include <stdexcept>

#include "plugin/ErrorText.h"

// Words cross the boundary as they lie in memory, and the target wants the low byte first.
static_assert(std::endian::native == std::endian::little);

namespace {

constexpr std::int16_t kRegisterPage = 1;

}  // namespace

void ProgressHandle::UpdateProgress(std::uint32_t percent, const std::string& text) const {
    ThrowOnError(p_mHost->UpdateProgress(percent, text.c_str()));
}

void ProgressHandle::CloseProgress() {
    if (IFlashHost* host = p_mHost.release()) ThrowOnError(host->EndProgress());
}

// The one way to the slots that return an error text, so that none can be dropped.
template <typename... Parameters, typename... Arguments>
void HostAccess::Call(const char* (IFlashHost::*slot)(Parameters...),
                      Arguments... arguments) const {
    ThrowOnError((p_mHost->*slot)(arguments...));
}

std::string HostAccess::GetSetting(const std::string& name) const {
    // The first answer only tells whether the setting exists; the second is the one that counts.
    // A host whose setting vanishes in between gets the same answer as one that never had it.
    const char* value = p_mHost->GetProperty(name.c_str());
    if (value != nullptr) value = p_mHost->GetProperty(name.c_str());
    if (value == nullptr) throw std::logic_error("Unknown property \"" + name + "\"");
    return value;
}

void HostAccess::SetSetting(const std::string& name, const std::string& value) const {
    Call(&IFlashHost::SetProperty, name.c_str(), value.c_str());
}

void HostAccess::HaltTarget() const {
    Call(&IFlashHost::HaltTarget);
}

void HostAccess::ResetTarget(bool flag) const {
    Call(&IFlashHost::ResetTarget, flag);
}

void HostAccess::RunTarget() const {
    Call(&IFlashHost::RunTarget);
}

void HostAccess::LoadProgram(const std::string& fileName, const std::string& directory) const {
    Call(&IFlashHost::LoadProgram, fileName.c_str(), "", directory.c_str());
}

void HostAccess::Sleep(std::uint32_t milliseconds) const {
    Call(&IFlashHost::Sleep, milliseconds);
}

std::uint32_t HostAccess::ReadWord(std::uint64_t address) const {
    std::uint32_t value = 0;
    Call(&IFlashHost::ReadMemory, &value, 1u, address, kRegisterPage, sizeof value);
    return value;
}

void HostAccess::WriteWord(std::uint64_t address, std::uint32_t value) const {
    Call(&IFlashHost::WriteMemory, &value, 1u, address, kRegisterPage, sizeof value);
}

void HostAccess::WriteHalfword(std::uint64_t address, std::uint16_t value) const {
    Call(&IFlashHost::WriteMemory, &value, 1u, address, kRegisterPage, sizeof value);
}

void HostAccess::ReadBytes(void* buffer, std::size_t count, std::uint64_t address,
                           std::int16_t page) const {
    Call(&IFlashHost::ReadMemory, buffer, count, address, page, 1u);
}

void HostAccess::WriteBytes(const void* buffer, std::size_t count, std::uint64_t address,
                            std::int16_t page) const {
    Call(&IFlashHost::WriteMemory, buffer, count, address, page, 1u);
}

ProgressHandle HostAccess::OpenProgress(const std::string& title) const {
    Call(&IFlashHost::BeginProgress, title.c_str());
    return ProgressHandle(p_mHost);
}

void HostAccess::ShowErrorText(const std::string& text) const {
    Call(&IFlashHost::ShowError, text.c_str());
}

void HostAccess::ShowMessageText(const std::string& text) const {
    Call(&IFlashHost::ShowMessage, text.c_str());
}

std::string HostAccess::Directory() const {
    return p_mHost->GetDirectory();
}
