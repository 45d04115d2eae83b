// One function for each slot, around which exceptions are caught.

#include "hostcheck/CheckedHost.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <vector>

namespace hostcheck {

// Words cross the boundary as they lie in memory, and the target wants the low byte first.
static_assert(std::endian::native == std::endian::little);

namespace {

constexpr std::uint8_t kUntouched = 0xA5;
constexpr std::size_t kMarginBytes = 4096;

// A register or a status goes into a word. What lies around a section goes into a block of the
// loader's, whatever part of it is read, and flash into four times what is asked for at most.
std::size_t RoomBytes(std::size_t bytes, std::size_t width) {
    constexpr std::size_t block = 128;
    constexpr std::size_t largest = std::size_t{4} * 32752;
    if (width != 1) return bytes;
    return bytes <= block ? block : largest;
}

bool AllUntouched(const std::uint8_t* first, const std::uint8_t* last) {
    return std::all_of(first, last, [](std::uint8_t byte) { return byte == kUntouched; });
}

}  // namespace

std::optional<std::string> CheckedHost::Text(const char* text) {
    if (text == nullptr) return std::nullopt;
    auto read = ReadableText(text);
    if (!read) throw Breach("a pointer that leads to no NUL-terminated text");
    return read;
}

// Memory that the host has given back is soon somebody else's; here it is asked for at once.
std::optional<std::string> CheckedHost::LastingText(const char* text) {
    constexpr std::size_t largest = 512;
    constexpr std::size_t step = 16;
    auto first = Text(text);
    if (!first) return first;
    std::vector<std::string> others;
    for (std::size_t i = 0; i < largest; ++i)
        others.emplace_back(step + i / 8 * step % largest, '#');
    if (ReadableText(text) != first) throw Breach("a text that changed without a call");
    return first;
}

std::optional<std::string> CheckedHost::Get(const std::string& name) const {
    return Ask([&](IFlashHost& host) { return host.GetProperty(name.c_str()); });
}

void CheckedHost::Set(const std::string& name, const std::string& value) const {
    Do([&](IFlashHost& host) { return host.SetProperty(name.c_str(), value.c_str()); });
}

// The margins lie around the room, so that a host that writes more is found out and survived.
Bytes CheckedHost::Read(std::uint32_t address, std::size_t bytes, std::size_t width,
                        std::int16_t onPage) const {
    const std::size_t room = RoomBytes(bytes, width);
    Bytes buffer(kMarginBytes + room + kMarginBytes, kUntouched);
    std::uint8_t* const inside = buffer.data() + kMarginBytes;
    Do([&](IFlashHost& host) {
        return host.ReadMemory(inside, bytes / width, address, onPage, width);
    });
    if (!AllUntouched(buffer.data(), inside)) throw Breach("bytes in front of the buffer");
    if (!AllUntouched(inside + room, inside + room + kMarginBytes))
        throw Breach("bytes behind the buffer, which has room for " + std::to_string(room));
    return {inside, inside + bytes};
}

// A host that reads too much from the buffer is found out by what it writes; it must not crash.
void CheckedHost::Write(std::uint32_t address, const Bytes& bytes, std::size_t width,
                        std::int16_t onPage) const {
    Bytes buffer = bytes;
    buffer.resize(4 * bytes.size() + kMarginBytes, kUntouched);
    Do([&](IFlashHost& host) {
        return host.WriteMemory(buffer.data(), bytes.size() / width, address, onPage, width);
    });
}

std::uint32_t CheckedHost::ReadWord(std::uint32_t address) const {
    std::uint32_t value = 0;
    std::memcpy(&value, Read(address, sizeof value, sizeof value).data(), sizeof value);
    return value;
}

void CheckedHost::WriteWord(std::uint32_t address, std::uint32_t value) const {
    Bytes bytes(sizeof value);
    std::memcpy(bytes.data(), &value, sizeof value);
    Write(address, bytes, sizeof value);
}

void CheckedHost::Halt() const {
    Do([](IFlashHost& host) { return host.HaltTarget(); });
}

void CheckedHost::Run() const {
    Do([](IFlashHost& host) { return host.RunTarget(); });
}

void CheckedHost::Reset(bool flag) const {
    Do([flag](IFlashHost& host) { return host.ResetTarget(flag); });
}

void CheckedHost::Sleep(std::uint32_t milliseconds) const {
    Do([milliseconds](IFlashHost& host) { return host.Sleep(milliseconds); });
}

void CheckedHost::Announce(const char* text) const {
    try {
        Ask([text](IFlashHost& host) { return host.ShowMessage(text); });
    } catch (const Breach&) {
        // The next line that is shown comes to the same.
    }
}

}  // namespace hostcheck
