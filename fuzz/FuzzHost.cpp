#include "fuzz/FuzzHost.h"

#include <cstring>

#include "logger/ostrel_logger.h"

namespace {

// What settings hold besides their ordinary values, and what is far from all of them.
constexpr const char* kSettingTexts[] = {"0",
                                         "1",
                                         "",
                                         "Entire Flash",
                                         "By Address Range",
                                         "0xFFFFFFFF",
                                         "Do Not Erase Flash Memory",
                                         "-2147483648",
                                         "Use the Erase Options Specified Below",
                                         "400",
                                         "  +7 ",
                                         "99999999999"};

// An answer byte from here on is a failure; below, what an answer means is the call's affair.
constexpr std::uint8_t kFailureByte = 0xF0;

}  // namespace

std::uint32_t ByteSource::Word() {
    std::uint32_t word = 0;
    for (int i = 0; i < 4; ++i)
        word = word << 8 | Byte();
    return word;
}

std::string ByteSource::Text() {
    std::string text;
    for (int left = Byte() % 64; left > 0 && !Empty(); --left)
        text += static_cast<char>(Byte());
    return text.c_str();
}

ByteSource ByteSource::Split(std::size_t size) {
    const auto* begin = at_;
    at_ += std::min(size, static_cast<std::size_t>(end_ - at_));
    return {begin, at_};
}

// With a sink in place, the trace lines are made as well.
FuzzHost::FuzzHost(ByteSource answers) : settings(test::OrdinarySettings()), answers_(answers) {
    OstrelLoggerSetSink([](void*, int, const char* text) { RequireText(text); }, nullptr);
}

FuzzHost::~FuzzHost() {
    OstrelLoggerSetSink(nullptr, nullptr);
}

void FuzzHost::CallReturned() {
    Require(openDisplays_ == 0, "every display that was begun is ended");
    callsSinceLost_ = 0;
    kept_.reset();
}

void FuzzHost::BecomeOrdinary() {
    settings = test::OrdinarySettings();
    registers.clear();
    answers_ = {nullptr, nullptr};
    work_ = 0;
    errorsShown = 0;
}

const char* FuzzHost::Kept(std::string text) {
    kept_ = std::make_unique<std::string>(std::move(text));
    return kept_->c_str();
}

bool FuzzHost::IsLost(std::size_t work) {
    kept_.reset();
    work_ += work;
    if (work_ <= kWorkUntilLost) return false;
    Require(++callsSinceLost_ <= kCallsToNotice, "a lost connection ends the call soon");
    return true;
}

const char* FuzzHost::Answer(const char* text) {
    RequireText(text);
    if (IsLost()) return Kept("connection lost");
    const std::uint8_t byte = answers_.Byte();
    if (byte < kFailureByte) return nullptr;
    switch (byte % 4) {
        case 0:
            return Kept("");
        case 1:
            return Kept(std::string(70000, 'x'));
        case 2:
            return Kept("%s%n {} failure");
        default:
            return Kept(answers_.Text());
    }
}

const char* FuzzHost::GetProperty(const char* name) {
    const auto found = settings.find(name);
    if (IsLost() || found == settings.end()) return nullptr;
    const std::uint8_t byte = answers_.Byte();
    if (byte < 0xC0) return Kept(found->second);
    if (byte < 0xE0) return Kept(kSettingTexts[byte % std::size(kSettingTexts)]);
    return byte < kFailureByte ? Kept(answers_.Text()) : nullptr;
}

const char* FuzzHost::SetProperty(const char* name, const char* value) {
    const char* error = Answer(value);
    if (error == nullptr) settings[name] = value;
    return error;
}

const char* FuzzHost::LoadProgram(const char* fileName, const char* second, const char* directory) {
    Require(*second == '\0' && std::strlen(fileName) > 0, "the loader is asked for as agreed");
    return Answer(directory);
}

const char* FuzzHost::ReadMemory(void* buffer, size_t count, uint64_t address, int16_t,
                                 size_t width) {
    Require(address + count * width <= 0x1'0000'0000 || width == 1, "an address has 32 bits");
    if (IsLost(1 + count * width / 1024)) return Kept("connection lost");
    const std::uint8_t byte = answers_.Byte();
    if (byte >= kFailureByte) return Kept("read failure");
    if (width != 4) {
        std::memset(buffer, byte ^ 0xFF, count * width);
        return nullptr;
    }
    const std::uint32_t value = byte < 0xA0   ? registers[static_cast<std::uint32_t>(address)]
                                : byte < 0xB0 ? 0
                                : byte < 0xC0 ? 0xFFFFFFFF
                                              : answers_.Word();
    std::memcpy(buffer, &value, sizeof value);
    return nullptr;
}

const char* FuzzHost::WriteMemory(const void* buffer, size_t count, uint64_t address, int16_t,
                                  size_t width) {
    const std::string bytes(static_cast<const char*>(buffer), count * width);
    const char* error = Answer();
    if (error == nullptr && width == 4 && address != 0x400FD008) {
        std::memcpy(&registers[static_cast<std::uint32_t>(address)], bytes.data(), 4);
    }
    return error;
}

const char* FuzzHost::BeginProgress(const char* title) {
    Require(openDisplays_ == 0, "one display at a time");
    const char* error = Answer(title);
    openDisplays_ += error == nullptr;
    return error;
}

const char* FuzzHost::UpdateProgress(uint32_t, const char* text) {
    Require(openDisplays_ == 1, "only an open display is updated");
    return Answer(text);
}

const char* FuzzHost::EndProgress() {
    Require(--openDisplays_ == 0, "only an open display is ended");
    return Answer();
}

const char* FuzzHost::ShowError(const char* text) {
    ++errorsShown;
    return Answer(text);
}
