// Taking and putting back, each through requests that every server has.

#include "target/gdb/probe/SavedTarget.h"

#include <fmt/format.h>

#include <algorithm>
#include <utility>

#include "base/AddressSet.h"
#include "base/Hex.h"

namespace target::gdb {

namespace {

// Of a server that describes none.
constexpr unsigned kAllRegisters = ~0U;

/// Calls `step` with each part of the range that a block has: where it begins in the range and in
/// the block, and its size.
template <typename Blocks, typename Step>
void ForEachShared(Blocks& blocks, std::uint32_t address, std::size_t size, Step step) {
    for (auto& block : blocks) {
        const std::uint64_t first = std::max(address, block.address);
        const std::uint64_t end = std::min(std::uint64_t{address} + size,
                                           std::uint64_t{block.address} + block.bytes.size());
        if (first < end) step(block, first - address, first - block.address, end - first);
    }
}

}  // namespace

SavedTarget::SavedTarget(GdbTarget& probe, const std::vector<base::AddressRange>& memory,
                         DebuggerRequests requests)
    : probe_(probe), requests_(std::move(requests)) {
    try {
        Take(memory);
    } catch (const ProtocolError& error) {
        throw TargetError(fmt::format(
            "Saving what the debugger has on the target: the GDB server {}", error.what()));
    }
}

void SavedTarget::Take(const std::vector<base::AddressRange>& memory) {
    // Other threads than the core's own have registers in memory.
    if (!requests_.threads.empty()) probe_.Wire().Agrees("Hg0");
    for (const auto& [key, request] : requests_.breakpoints)
        probe_.Wire().Ask("z" + key);
    registers_ = ReadRegisters(0);
    FindGeneralRegisters();
    base::AddressSet ranges;
    for (const base::AddressRange& range : memory)
        ranges.Add(range);
    for (const base::AddressRange& range : ranges.Ranges()) {
        std::string bytes(range.Size(), '\0');
        probe_.Read(bytes.data(), bytes.size(), range.first, 0, 1);
        memory_.push_back({range.first, std::move(bytes)});
    }
}

/// From this number on, without those that the server doesn't tell, which nobody can have set
/// either.
std::map<unsigned, std::string> SavedTarget::ReadRegisters(unsigned first) {
    std::map<unsigned, std::string> values;
    if (probe_.Registers().empty()) values[kAllRegisters] = probe_.Wire().Ask("g");
    for (const auto& [name, number] : probe_.Registers()) {
        if (number < first) continue;
        const std::string reply = probe_.Wire().Ask(fmt::format("p{:x}", number));
        if (!IsError(reply) && base::FromHex(reply)) values[number] = reply;
    }
    if (first == 0 && (values.empty() || IsRefusal(values.begin()->second)))
        throw ProtocolError("doesn't tell the core's registers, which could not be put back");
    return values;
}

// Packet "g" has the registers in the order of their numbers, as far as the server goes.
void SavedTarget::FindGeneralRegisters() {
    const std::string all = probe_.Wire().Ask("g");
    std::string values;
    for (const auto& [number, value] : registers_) {
        if (number == kAllRegisters || values.size() >= all.size()) break;
        values += value;
        firstOther_ = number + 1;
    }
    if (values == all) general_ = all;
}

/// Returns the number of one that wasn't yet as it should be. Some are others under a second name.
std::optional<unsigned> SavedTarget::WriteRegisters(bool allAtOnce) {
    std::optional<unsigned> written;
    unsigned first = 0;
    if (!general_.empty() && probe_.Wire().Ask("g") == general_) {
        first = firstOther_;
    } else if (allAtOnce && !general_.empty() && probe_.Wire().Agrees("G" + general_)) {
        first = firstOther_;
        written = registers_.begin()->first;
    }
    const auto now = ReadRegisters(first);
    for (const auto& [number, value] : registers_) {
        if (number < first) continue;
        const auto found = now.find(number);
        if (found != now.end() && found->second == value) continue;
        written = number;
        probe_.Wire().Agrees(number == kAllRegisters ? "G" + value
                                                     : fmt::format("P{:x}={}", number, value));
    }
    return written;
}

void SavedTarget::PutBack() try {
    for (const Block& block : memory_)
        probe_.Write(block.bytes.data(), block.bytes.size(), block.address, 0, 1);
    constexpr int kTimes = 3;
    std::optional<unsigned> written = WriteRegisters(true);
    for (int i = 1; written && i < kTimes; ++i)
        written = WriteRegisters(false);
    if (written) throw ProtocolError(fmt::format("doesn't take register {}", *written));
    for (const auto& [key, request] : requests_.breakpoints)
        probe_.Wire().RequireOk(request);
    for (const auto& [what, request] : requests_.threads)
        probe_.Wire().RequireOk(request);
} catch (const ProtocolError& error) {
    throw TargetError(fmt::format(
        "Putting back what the debugger had on the target: the GDB server {}", error.what()));
}

bool SavedTarget::Touches(const base::AddressRange& range) const {
    return std::ranges::any_of(memory_, [&](const Block& block) {
        return range.first < block.address + std::uint64_t{block.bytes.size()} &&
               range.last >= block.address;
    });
}

bool SavedTarget::Holds(const base::AddressRange& range) const {
    std::uint64_t held = 0;
    ForEachShared(memory_, range.first, range.Size(),
                  [&](const Block&, std::size_t, std::size_t, std::size_t size) { held += size; });
    return held == range.Size();
}

void SavedTarget::Overlay(std::uint32_t address, std::string& bytes) const {
    ForEachShared(memory_, address, bytes.size(),
                  [&](const Block& block, std::size_t to, std::size_t from, std::size_t size) {
                      bytes.replace(to, size, block.bytes, from, size);
                  });
}

void SavedTarget::Write(std::uint32_t address, std::string_view bytes) {
    ForEachShared(memory_, address, bytes.size(),
                  [&](Block& block, std::size_t from, std::size_t to, std::size_t size) {
                      block.bytes.replace(to, size, bytes.substr(from, size));
                  });
}

}  // namespace target::gdb
