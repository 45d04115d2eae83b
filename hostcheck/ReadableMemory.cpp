// The system copies the text a page at a time.

#include "hostcheck/ReadableMemory.h"

#include <algorithm>
#include <array>
#include <cstdint>

#include "base/system/ReadableMemory.h"

namespace hostcheck {

namespace {

constexpr std::size_t kPageBytes = 4096;  // larger pages are multiples of that
constexpr std::size_t kTextBytesMax = std::size_t{64} * 1024;

}  // namespace

// Up to the end of a page at a time: what lies behind the end of the text may belong to nobody.
std::optional<std::string> ReadableText(const char* text) {
    std::string read;
    std::array<char, kPageBytes> bytes{};
    while (read.size() < kTextBytesMax) {
        const char* next = text + read.size();
        const std::size_t count = kPageBytes - reinterpret_cast<std::uintptr_t>(next) % kPageBytes;
        if (!base::CopyReadable(bytes.data(), next, count)) return std::nullopt;
        const char* const first = bytes.data();
        const char* const end = std::find(first, first + count, '\0');
        read.append(first, end);
        if (end != first + count) return read;
    }
    return std::nullopt;
}

}  // namespace hostcheck
