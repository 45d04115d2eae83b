#include "plugin/HostAccess.h"

#include <bit>
#include <stdexcept>

#include "plugin/ErrorText.h"

// Words cross the boundary as they lie in memory, and the target wants the low byte first.
static_assert(std::endian::native == std::endian::little);

namespace {

constexpr std::int16_t kRegisterPage = 1;

}  // namespace

std::string HostAccess::GetSetting(const std::string& name) const {
    // The first answer only tells whether the setting exists; the second is the one that counts.
    // A host whose setting vanishes in between gets the same answer as one that never had it.
    const char* value = p_mHost->GetProperty(name.c_str());
    if (value != nullptr) value = p_mHost->GetProperty(name.c_str());
    if (value == nullptr) throw std::logic_error("Unknown property \"" + name + "\"");
    return value;
}

void HostAccess::SetSetting(const std::string& name, const std::string& value) const {
    ThrowOnError(p_mHost->SetProperty(name.c_str(), value.c_str()));
}

std::uint32_t HostAccess::ReadWord(std::uint64_t address) const {
    std::uint32_t value = 0;
    ThrowOnError(p_mHost->ReadMemory(&value, 1, address, kRegisterPage, sizeof value));
    return value;
}

void HostAccess::WriteWord(std::uint64_t address, std::uint32_t value) const {
    ThrowOnError(p_mHost->WriteMemory(&value, 1, address, kRegisterPage, sizeof value));
}

ProgressHandle HostAccess::OpenProgress(const std::string& title) const {
    ThrowOnError(p_mHost->BeginProgress(title.c_str()));
    return ProgressHandle(p_mHost);
}

void HostAccess::CloseProgress(ProgressHandle& progress) {
    if (IFlashHost* host = std::exchange(progress.p_mHost, nullptr)) {
        ThrowOnError(host->EndProgress());
    }
}

void HostAccess::ShowErrorText(const std::string& text) const {
    ThrowOnError(p_mHost->ShowError(text.c_str()));
}

void HostAccess::ShowMessageText(const std::string& text) const {
    ThrowOnError(p_mHost->ShowMessage(text.c_str()));
}

std::string HostAccess::Directory() const {
    return p_mHost->GetDirectory();
}
