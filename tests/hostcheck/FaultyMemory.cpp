// Hosts that don't move the bytes which they are asked to move.

#include <algorithm>
#include <cstring>
#include <map>

#include "tests/hostcheck/CheckedHosts.h"

namespace test {

namespace {

using std::string;
using H = CheckedHost;

constexpr uint64_t kNowhere = 0x10000000;
constexpr uint64_t kRam = 0x20000000;
constexpr uint64_t kRegisters = 0x40000000;
constexpr unsigned char kZeros[4] = {};

bool IsFlash(uint64_t address) {
    return address < 0x8000;
}

/// Turns the bytes of each element that is written in a range.
Spoil Turned(uint64_t from, uint64_t end) {
    return Bent([=, bytes = string()](Transfer& t, auto&) mutable {
        if (t.Reads() || t.width == 1 || t.address < from || t.address >= end) return;
        bytes.assign(static_cast<const char*>(t.from), t.count * t.width);
        for (size_t i = 0; i < bytes.size(); i += t.width)
            std::reverse(&bytes[i], &bytes[i] + t.width);
        t.from = bytes.data();
    });
}

/// Registers that come the wrong way round, whichever way they go.
Spoil TurnedRegisters(uint32_t identification, uint32_t capabilities) {
    return [=](H& h) {
        if (capabilities != 0) h.target.registers[0x400FE008] = capabilities;
        h.target.registers[0x400FE000] = identification;
        for (auto& [address, value] : h.target.registers)
            value = __builtin_bswap32(value);
    };
}

/// What is read or written first is kept, and returned ever after.
Spoil Cached(bool (*cached)(uint64_t address)) {
    return On(&H::move,
              [cached, kept = std::map<uint64_t, string>()](
                  auto&, auto& move, const Transfer& t) mutable -> const char* {
                  if (!cached(t.address)) return move(t);
                  string& bytes = kept[t.address];
                  if (t.Writes() || bytes.size() != t.count * t.width) {
                      if (const char* error = move(t)) return error;
                      bytes.assign(static_cast<const char*>(t.Writes() ? t.from : t.to),
                                   t.count * t.width);
                  }
                  if (t.Reads()) std::memcpy(t.to, bytes.data(), bytes.size());
                  return nullptr;
              });
}

/// A byte beside the buffer of a read, which becomes 0.
void Overrun(const Transfer& t, ptrdiff_t offset) {
    static_cast<char*>(t.to)[offset] = 0;
}

const FaultyHost kFaultyMemory[] = {
    {"register at 0x400FE000; came bytes behind the buffer, which has room for 4\n",
     Bent([](Transfer& t, auto&) { return t.Reads() ? Overrun(t, 4) : void(); })},
    {"expected the identification register at 0x400FE000; came the error text \"no mem",
     Refused("no memory", [n = 0](auto&) mutable { return n++ == 0; })},
    {"expected a word of RAM during CreateFlashDevice2; came bytes in front of the buf",
     Bent([](Transfer& t, auto&) {
         if (t.Reads() && t.address >= kRam && t.address < kRegisters) Overrun(t, -1);
     })},
    {"with the least significant byte first; came 0x00000A10 for 0x100A0000, with which",
     TurnedRegisters(0x100A0000, 0)},
    {"with the least significant byte first; came 0x00000510 for 0x10050000, with which",
     TurnedRegisters(0x10050000, 0x00FF007F)},
    {"register at 0x400FD000 as it was written; came 0x00800000 instead of 0x00008000\n",
     Turned(kRegisters, ~0ULL)},
    // Byte by byte, of which the register takes the last.
    {"flash address register at 0x400FD000 as it was written; came 0x00000000 instead",
     Bent([](Transfer& t, auto&) {
         t.address += t.Writes() && t.address > kRegisters ? 0x1000U : 0U;
     })},
    {"expected the flash address register at 0x400FD000 as it was written; came the er",
     Bent(
         [](Transfer& t, auto&) { t.width = t.Writes() && t.address > kRegisters ? 1 : t.width; })},
    {"expected registers as they were; came 0x00000000 instead of 0x00004000 after the",
     On(&H::halt, [](H& h, auto& halt) { return h.target.Reset(), halt(); })},
    {"expected the same bytes in all widths, in the order of the buffer; came",
     Turned(0, kRegisters)},
    // Counts of bytes and of halfwords.
    {"expected the same bytes in all widths, in the order of the buffer; came",
     Bent([](Transfer& t, auto&) { t.width = t.count > 1 ? 1 : t.width; })},
    {"expected the same bytes in all widths, in the order of the buffer; came",
     Bent([](Transfer& t, auto&) { t.count = t.count > 1 ? t.count / 2 : 1; })},
    // A word for less; one byte too long; whole words; whole pieces, where there are several.
    {"WriteMemory: expected no change beside what is written; came", Bent([](Transfer& t, auto&) {
         if (t.Writes() && t.count * t.width <= 2) t = {nullptr, kZeros, 4, t.address & ~3u, 1};
     })},
    {"WriteMemory: expected no change beside what is written; came",
     Bent([](Transfer& t, auto&) { t.count += t.Writes() && t.width == 1; })},
    {"WriteMemory: expected no change beside what is written; came", Bent([](Transfer& t, auto&) {
         if (t.Writes() && t.width == 1) t.count = (t.count + 3) / 4 * 4;
     })},
    {"WriteMemory: expected no change beside what is written; came", Bent([](Transfer& t, auto&) {
         if (t.Writes() && t.count > 1024) t.count = 2048 + (t.address % 4 != 0);
     })},
    {"WriteMemory: expected writes in the order of the calls; came",
     Bent([](Transfer& t, auto&) { t.count *= t.count != 8 || t.address % 4 != 1; })},
    {"WriteMemory: expected 2048 bytes in one call; came",
     Bent([](Transfer& t, auto&) { t.count = t.Reads() && t.count == 2048 ? 1024 : t.count; })},
    // Nothing but whole halfwords.
    {"ReadMemory: expected any bytes of a block; came",
     Bent([](Transfer& t, auto&) { t.address -= t.Reads() && t.width == 1 ? t.address % 2 : 0; })},
    {"ReadMemory: expected any bytes of a block; came the error text \"odd\"",
     Refused("odd", [](auto& t) { return t.Reads() && t.width == 1 && t.count % 2 != 0; })},
    // The second piece over and over.
    {"ReadMemory: expected 6144 bytes of RAM in one call; came", Bent([](Transfer& t, H& h) {
         if (t.Writes() || t.count != 6144) return;
         for (const uint64_t at : {0U, 4096U})
             h.target.Move({static_cast<char*>(t.to) + at, t.from, 2048, t.address + at, 1});
         t = {static_cast<char*>(t.to) + 2048, nullptr, 2048, t.address, 1};
     })},
    {"expected 2048 bytes of flash on page 0; came the error text \"no memory\"",
     Bent([](Transfer& t, auto&) { t.address = t.page ? t.address : kNowhere; })},
    {"ReadMemory: expected 32752 bytes of flash in one call; came a5 a5",
     Bent([](Transfer& t, auto&) { t.count = std::min<size_t>(t.count, 16384); })},
    // The middle is wrong.
    {"ReadMemory: expected 32752 bytes of flash in one call; came 00 00 00 00",
     Bent([](Transfer& t, H& h) {
         if (t.count != 32752) return;
         std::memset(static_cast<char*>(t.to) + 16000, 0, 100);
         h.target.Move({t.to, nullptr, 16000, 0, 1});
         t = {static_cast<char*>(t.to) + 16100, nullptr, 32752 - 16100, 16100, 1};
     })},
    {"ReadMemory: expected an error text at 0x10000000, where nothing is; came null",
     Bent([](Transfer& t, auto&) {
         if (t.address == kNowhere) t = {t.to, t.from, 0, kRam, 1};
     })},
    {"expected an error text at 0x10000000, where nothing is; came a text that changed",
     On(&H::move,
        [](auto&, auto& move, auto& t) {
            return t.address == kNowhere ? Dangling("not mapped") : move(t);
        })},
    {"expected an error text at 0x10000000, where nothing is; came an exception",
     Bent([](Transfer& t, auto&) {
         return t.Writes() && t.address == kNowhere ? throw 1 : void();
     })},
    {"expected success after an access that failed; came the error text \"no memory\"",
     Refused("no memory",
             [failed = 0](auto& t) mutable {
                 failed += t.address == kNowhere;
                 return failed == 2 && t.Reads();
             })},
    {"expected flash on the page given to WriteDataToFlash; came the error text \"no m",
     Refused("no memory", [](auto& t) { return t.page == 1 && IsFlash(t.address); })},
    {"ReadMemory: expected flash on the page given to WriteDataToFlash; came",
     Bent([](Transfer& t, auto&) { t.address += t.page == 1 && IsFlash(t.address); })},
    {"expected flash as it is now, not as it was read before; came the bytes of the ROM",
     On(&H::reset, [](H& h, auto& reset, bool flag) { return Cached(IsFlash)(h), reset(flag); })},
    {"WriteMemory: expected 2048 bytes of RAM while the program runs; came",
     Bent([](Transfer& t, H& h) { t.count = t.Writes() && h.target.running ? 0 : t.count; })},
    {"expected 2048 bytes of RAM while the program runs; came the error text \"no mem",
     Bent([](Transfer& t, H& h) {
         t.address = t.Writes() && h.target.running ? kNowhere : t.address;
     })},
    {"that are reset; came 0x00004000, as it was written before, when the flag is true",
     Cached([](uint64_t address) { return address > kRegisters; })},
    {"a loader that takes the chunk in block 0; came \"to do\" in block 0 after 1 s",
     On(&H::run,
        [](H& h, auto& run) {
            if (h.Told("Host check, WriteDataToFlash"))
                Cached([](uint64_t address) { return address == 0x2000100C; })(h);
            return run();
        })},
    {"do\" in the two status words, whatever RAM held; came 0xFFFFFFFF and 0xFFFFFFFF",
     Cached([](uint64_t address) { return address / 32 == 0x20001000 / 32; })},
};

}  // namespace

std::span<const FaultyHost> FaultyMemory() {
    return kFaultyMemory;
}

}  // namespace test
