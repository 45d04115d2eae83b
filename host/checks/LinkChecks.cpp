// What the server says of accesses that fail, and whether registers are reached as they must be.

#include <fmt/format.h>

#include "base/Hex.h"
#include "host/checks/CheckTable.h"
#include "host/facts/FlashMemory.h"
#include "host/facts/LoaderMemory.h"

namespace host {

namespace {

std::uint32_t ReadWord(target::Target& target, std::uint32_t address) {
    std::uint32_t word = 0;
    target.Read(&word, 1, address, plugin::kRamPage, sizeof word);
    return word;
}

void WriteWord(target::Target& target, std::uint32_t address, std::uint32_t word) {
    target.Write(&word, 1, address, plugin::kRamPage, sizeof word);
}

}  // namespace

std::string CheckFailedReads(CheckSubject& subject) {
    std::uint32_t word = 0;
    try {
        word = ReadWord(subject.Target(), plugin::kNothingAt);
    } catch (const target::TargetError&) {
        // The server must still be there to have said so.
        ReadWord(subject.Target(), plugin::kIdentificationRegister);
        return fmt::format("told: {} can't be read", base::HexText(plugin::kNothingAt));
    }
    const std::string hidden = fmt::format("hidden: {:#010x} is read at {}, where nothing is", word,
                                           base::HexText(plugin::kNothingAt));
    if (subject.readsTrusted) throw CheckNoted(hidden + "; trusted by --gdb-option reads=trusted");
    throw CheckFailed(hidden);
}

/// The flash address register takes any sector's address and does nothing by itself.
std::string CheckRegisters(CheckSubject& subject) {
    target::Target& target = subject.Target();
    constexpr std::uint32_t kPatterns[] = {0x1400, 0xA800};
    const std::uint32_t before = ReadWord(target, plugin::kFlashAddressRegister);
    for (const std::uint32_t pattern : kPatterns) {
        WriteWord(target, plugin::kFlashAddressRegister, pattern);
        const std::uint32_t now = ReadWord(target, plugin::kFlashAddressRegister);
        if (now == pattern) continue;
        WriteWord(target, plugin::kFlashAddressRegister, before);
        throw CheckFailed(fmt::format("{} holds {:#010x} after {:#010x} was written",
                                      base::HexText(plugin::kFlashAddressRegister), now, pattern));
    }
    WriteWord(target, plugin::kFlashAddressRegister, before);
    return fmt::format("32 bits of {} written and read back",
                       base::HexText(plugin::kFlashAddressRegister));
}

std::string CheckHalfRegisters(CheckSubject& subject) try {
    std::uint16_t halves[2] = {};
    for (std::uint32_t i = 0; i < 2; ++i)
        subject.Target().Read(&halves[i], 1, plugin::kIdentificationRegister + 2 * i,
                              plugin::kRamPage, 2);
    const std::uint32_t word = halves[0] | std::uint32_t{halves[1]} << 16;
    if (word == subject.info.identification) return "16 bits of the identification read";
    throw CheckNoted(fmt::format("the identification reads {:#010x} in halves, {:#010x} as a whole",
                                 word, subject.info.identification));
} catch (const target::TargetError&) {
    ReadWord(subject.Target(), plugin::kIdentificationRegister);
    return "16 bits are refused and reported; a load needs none";
}

std::string CheckPackets(CheckSubject& subject) {
    const auto server = subject.opened.Server();
    if (!server) throw CheckNotMade("there is no server: the target is simulated in the tool");
    const std::size_t room = server->packetBytes / (server->binaryWrites ? 1 : 2);
    const std::size_t packets = (plugin::kChunkBytes + room - 1) / room;
    std::string text =
        fmt::format("{} bytes, written {}: about {} for a chunk of 2 KiB", server->packetBytes,
                    server->binaryWrites ? "as they are" : "in hexadecimal digits",
                    packets == 1 ? "1 packet" : fmt::format("{} packets", packets));
    constexpr std::size_t kManyPackets = 8;
    if (packets > kManyPackets) throw CheckNoted(text);
    return text;
}

}  // namespace host
