// One function for each slot, around which exceptions are caught.

#include "hostcheck/CheckedHost.h"

#include <algorithm>

namespace hostcheck {

namespace {

constexpr std::uint8_t kUntouched = 0xA5;
constexpr std::size_t kMargin = 64;

}  // namespace

std::optional<std::string> CheckedHost::Text(const char* text) {
    if (text == nullptr) return std::nullopt;
    auto read = ReadableText(text);
    if (!read) throw Breach("a pointer that leads to no NUL-terminated text");
    return read;
}

std::optional<std::string> CheckedHost::Get(const std::string& name) const {
    return Ask([&](IFlashHost& host) { return host.GetProperty(name.c_str()); });
}

void CheckedHost::Set(const std::string& name, const std::string& value) const {
    Do([&](IFlashHost& host) { return host.SetProperty(name.c_str(), value.c_str()); });
}

Bytes CheckedHost::Read(std::uint32_t address, std::size_t bytes, std::size_t width,
                        std::int16_t onPage) const {
    Bytes buffer(bytes + 2 * kMargin, kUntouched);
    std::uint8_t* const inside = buffer.data() + kMargin;
    Do([&](IFlashHost& host) {
        return host.ReadMemory(inside, bytes / width, address, onPage, width);
    });
    const auto untouched = [](std::uint8_t byte) { return byte == kUntouched; };
    if (!std::all_of(buffer.data(), inside, untouched) ||
        !std::all_of(inside + bytes, inside + bytes + kMargin, untouched))
        throw Breach("bytes beside the buffer");
    return {inside, inside + bytes};
}

void CheckedHost::Write(std::uint32_t address, const Bytes& bytes, std::size_t width,
                        std::int16_t onPage) const {
    Do([&](IFlashHost& host) {
        return host.WriteMemory(bytes.data(), bytes.size() / width, address, onPage, width);
    });
}

void CheckedHost::Halt() const {
    Do([](IFlashHost& host) { return host.HaltTarget(); });
}

}  // namespace hostcheck
