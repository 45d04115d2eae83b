// Hosts that don't move the bytes which they are asked to move.

#include <algorithm>
#include <cstring>
#include <map>

#include "tests/hostcheck/CheckedHosts.h"

namespace test {

namespace {

using std::string;

constexpr uint64_t kNowhere = 0x10000000;
constexpr uint64_t kRegisters = 0x40000000;

/// Turns the bytes of each element that is written there.
struct Turned {
    uint64_t from;
    string bytes;

    void operator()(Transfer& t) {
        if (t.to != nullptr || t.width == 1 || t.address < from) return;
        bytes.assign(static_cast<const char*>(t.from), t.count * t.width);
        for (size_t i = 0; i < bytes.size(); i += t.width)
            std::reverse(&bytes[i], &bytes[i] + t.width);
        t.from = bytes.data();
    }
};

/// Registers that come the wrong way round, whichever way they go.
void TurnRegisters(CheckedHost& host, uint32_t identification) {
    for (auto& [address, value] : host.target.registers)
        value = __builtin_bswap32(value);
    host.target.registers[0x400FE000] = __builtin_bswap32(identification);
}

/// What is read or written first is kept, and returned ever after.
template <typename Cached>
void Cache(CheckedHost& host, Cached cached) {
    host.move = [move = host.move, cached,
                 kept = std::map<uint64_t, string>()](const Transfer& t) mutable -> const char* {
        if (!cached(t.address)) return move(t);
        const size_t bytes = t.count * t.width;
        if (t.to == nullptr) {
            kept[t.address].assign(static_cast<const char*>(t.from), bytes);
            return move(t);
        }
        if (kept[t.address].size() != bytes) {
            if (const char* error = move(t)) return error;
            kept[t.address].assign(static_cast<const char*>(t.to), bytes);
        }
        std::memcpy(t.to, kept[t.address].data(), bytes);
        return nullptr;
    };
}

const FaultyHost kFaultyMemory[] = {
    {"ReadMemory: expected the identification register at 0x400FE000; came 0xFFFFFFFF: nothing ans",
     [](CheckedHost& h) { h.target.registers[0x400FE000] = 0xFFFFFFFF; }},
    {"ReadMemory: expected the identification register at 0x400FE000; came 0x00000000: nothing ans",
     [](CheckedHost& h) { h.target.registers[0x400FE000] = 0; }},
    {"ReadMemory: expected the identification register at 0x400FE000; came bytes behind the buffer,"
     " which has room for 4\n",
     [](CheckedHost& h) {
         h.move = [move = h.move](const Transfer& t) {
             if (t.to != nullptr) static_cast<char*>(t.to)[t.count * t.width] = 0;
             return move(t);
         };
     }},
    {"ReadMemory: expected the identification register at 0x400FE000; came the error text \"no mem",
     [](CheckedHost& h) {
         h.move = [move = h.move, count = 0](const Transfer& t) mutable {
             return count++ == 0 ? "no memory" : move(t);
         };
     }},
    {"ReadMemory: expected a word of RAM during CreateFlashDevice2; came bytes in front of the buf",
     [](CheckedHost& h) {
         h.Bend([](Transfer& t) {
             const bool ram = t.address >= 0x20000000 && t.address < kRegisters;
             if (t.to != nullptr && ram) static_cast<char*>(t.to)[-1] = 0;
         });
     }},
    {"ReadMemory: expected registers with the least significant byte first; came 0x00000A10 for "
     "0x100A0000, with which",
     [](CheckedHost& h) { TurnRegisters(h, 0x100A0000); }},
    {"ReadMemory: expected registers with the least significant byte first; came 0x00000510 for "
     "0x10050000, with which",
     [](CheckedHost& h) {
         h.target.registers[0x400FE008] = 0x00FF007F;
         TurnRegisters(h, 0x10050000);
     }},
    {"WriteMemory: expected the flash address register at 0x400FD000 as it was written; came "
     "0x00800000 instead of 0x00008000\n",
     [](CheckedHost& h) {
         h.Bend(Turned{kRegisters, {}});
     }},
    {"WriteMemory: expected the flash address register at 0x400FD000 as it was written; came "
     "0x00000000 instead",
     [](CheckedHost& h) {  // byte by byte, of which the register takes the last
         h.Bend([](Transfer& t) {
             if (t.to == nullptr && t.address > kRegisters) t.address += 0x1000;
         });
     }},
    {"WriteMemory: expected the flash address register at 0x400FD000 as it was written; came the "
     "er",
     [](CheckedHost& h) {
         h.Bend([](Transfer& t) {
             if (t.to == nullptr && t.address > kRegisters) t.width = 1;
         });
     }},
    {"HaltTarget: expected registers as they were; came 0x00000000 instead of 0x00004000 after the",
     [](CheckedHost& h) {
         h.halt = [&h, halt = h.halt] {
             h.target.Reset();
             return halt();
         };
     }},
    {"WriteMemory: expected the same bytes in all widths, in the order of the buffer; came",
     [](CheckedHost& h) {
         h.Bend([turned = Turned{0, {}}](Transfer& t) mutable {
             if (t.address < kRegisters) turned(t);
         });
     }},
    {"WriteMemory: expected the same bytes in all widths, in the order of the buffer; came",
     [](CheckedHost& h) {  // a count of bytes
         h.Bend([](Transfer& t) {
             if (t.count > 1 && t.width > 1) t = {t.to, t.from, t.count, t.address, 1, t.page};
         });
     }},
    {"WriteMemory: expected the same bytes in all widths, in the order of the buffer; came",
     [](CheckedHost& h) {  // a count of halfwords
         h.Bend([](Transfer& t) { t.count = t.count > 1 ? t.count / 2 : 1; });
     }},
    {"WriteMemory: expected no change beside what is written; came",
     [](CheckedHost& h) {
         h.Bend([](Transfer& t) {
             static const unsigned char word[4] = {};
             if (t.to == nullptr && t.count * t.width <= 2) t = {t.to, word, 4, t.address & ~3u, 1};
         });
     }},
    {"WriteMemory: expected no change beside what is written; came",
     [](CheckedHost& h) {  // one byte too long
         h.Bend([](Transfer& t) {
             if (t.to == nullptr && t.width == 1) ++t.count;
         });
     }},
    {"WriteMemory: expected no change beside what is written; came",
     [](CheckedHost& h) {  // whole words
         h.Bend([](Transfer& t) {
             if (t.to == nullptr && t.width == 1) t.count = (t.count + 3) / 4 * 4;
         });
     }},
    {"WriteMemory: expected no change beside what is written; came",
     [](CheckedHost& h) {  // whole pieces, where there are several
         h.Bend([](Transfer& t) {
             if (t.to == nullptr && t.count > 1024) t.count = 2048 + (t.address % 4 != 0);
         });
     }},
    {"WriteMemory: expected writes in the order of the calls; came",
     [](CheckedHost& h) {
         h.Bend([](Transfer& t) { t.count = t.count == 8 && t.address % 4 == 1 ? 0 : t.count; });
     }},
    {"WriteMemory: expected 2048 bytes in one call; came",
     [](CheckedHost& h) {
         h.Bend([](Transfer& t) {
             if (t.to != nullptr && t.count == 2048) t.count = 1024;
         });
     }},
    {"ReadMemory: expected any bytes of a block; came",
     [](CheckedHost& h) {  // nothing but whole words
         h.Bend([](Transfer& t) {
             if (t.to != nullptr && t.width == 1) t.address -= t.address % 2;
         });
     }},
    {"ReadMemory: expected any bytes of a block; came the error text \"odd\"",
     [](CheckedHost& h) {
         h.move = [move = h.move](const Transfer& t) {
             return t.count % 2 != 0 && t.width == 1 && t.to != nullptr ? "odd" : move(t);
         };
     }},
    {"ReadMemory: expected 6144 bytes of RAM in one call; came",
     [](CheckedHost& h) {  // the second piece over and over
         h.Bend([&h](Transfer& t) {
             if (t.to == nullptr || t.count != 6144) return;
             for (const uint64_t at : {0U, 4096U})
                 h.target.Move({static_cast<char*>(t.to) + at, t.from, 2048, t.address + at, 1});
             t.count = 2048;
             t.to = static_cast<char*>(t.to) + 2048;
         });
     }},
    {"ReadMemory: expected 2048 bytes of flash on page 0; came the error text \"no memory\"",
     [](CheckedHost& h) {
         h.Bend([](Transfer& t) { t.address = t.page ? t.address : kNowhere; });
     }},
    {"ReadMemory: expected 32752 bytes of flash in one call; came a5 a5",
     [](CheckedHost& h) {
         h.Bend([](Transfer& t) { t.count = std::min<size_t>(t.count, 16384); });
     }},
    {"ReadMemory: expected 32752 bytes of flash in one call; came 00 00 00 00",
     [](CheckedHost& h) {  // the middle is wrong
         h.Bend([&h](Transfer& t) {
             if (t.count != 32752) return;
             std::memset(static_cast<char*>(t.to) + 16000, 0, 100);
             h.target.Move({t.to, nullptr, 16000, 0, 1});
             t = {static_cast<char*>(t.to) + 16100, nullptr, 32752 - 16100, 16100, 1};
         });
     }},
    {"ReadMemory: expected an error text at 0x10000000, where nothing is; came null",
     [](CheckedHost& h) {
         h.Bend([](Transfer& t) {
             if (t.address == kNowhere) t = {t.to, t.from, 0, 0x20000000, 1};
         });
     }},
    {"ReadMemory: expected an error text at 0x10000000, where nothing is; came a text that changed",
     [](CheckedHost& h) {
         h.move = [move = h.move](const Transfer& t) {
             return t.address == kNowhere ? Dangling("not mapped") : move(t);
         };
     }},
    {"WriteMemory: expected an error text at 0x10000000, where nothing is; came an exception",
     [](CheckedHost& h) {
         h.Bend([](Transfer& t) {
             if (t.to == nullptr && t.address == kNowhere) throw 1;
         });
     }},
    {"ReadMemory: expected success after an access that failed; came the error text \"no memory\"",
     [](CheckedHost& h) {
         h.Bend([failed = 0](Transfer& t) mutable {
             if (t.address == kNowhere) ++failed;
             if (failed == 2 && t.to != nullptr) t.address = kNowhere;
         });
     }},
    {"ReadMemory: expected flash on the page given to WriteDataToFlash; came the error text \"no m",
     [](CheckedHost& h) {
         h.Bend([](Transfer& t) {
             if (t.page == 1 && t.address < 0x8000) t.address = kNowhere;
         });
     }},
    {"ReadMemory: expected flash on the page given to WriteDataToFlash; came",
     [](CheckedHost& h) {
         h.Bend([](Transfer& t) {
             if (t.page == 1 && t.address < 0x8000) t.address += 1;
         });
     }},
    {"ReadMemory: expected flash as it is now, not as it was read before; came the bytes of the "
     "ROM",
     [](CheckedHost& h) {
         h.reset = [&h, reset = h.reset](bool flag) {
             Cache(h, [](uint64_t address) { return address < 0x8000; });
             return reset(flag);
         };
     }},
    {"WriteMemory: expected 2048 bytes of RAM while the program runs; came",
     [](CheckedHost& h) {
         h.Bend([&h](Transfer& t) {
             if (t.to == nullptr && h.target.running) t.count = 0;
         });
     }},
    {"WriteMemory: expected 2048 bytes of RAM while the program runs; came the error text \"no mem",
     [](CheckedHost& h) {
         h.Bend([&h](Transfer& t) {
             if (t.to == nullptr && h.target.running) t.address = kNowhere;
         });
     }},
    {"ResetTarget: expected registers that are reset; came 0x00004000, as it was written before, "
     "when the flag is true",
     [](CheckedHost& h) { Cache(h, [](uint64_t address) { return address > kRegisters; }); }},
    {"RunTarget: expected a loader that takes the chunk in block 0; came \"to do\" in block 0 "
     "after "
     "1 s",
     [](CheckedHost& h) {
         h.run = [&h, run = h.run] {
             if (h.Told("Host check, WriteDataToFlash"))
                 Cache(h, [](uint64_t address) { return address == 0x2000100C; });
             return run();
         };
     }},
    {"LoadProgram: expected no \"to do\" in the two status words, whatever RAM held; came "
     "0xFFFFFFFF and 0xFFFFFFFF",
     [](CheckedHost& h) {
         Cache(h, [](uint64_t address) { return address / 32 == 0x20001000 / 32; });
     }},
};

}  // namespace

std::span<const FaultyHost> FaultyMemory() {
    return kFaultyMemory;
}

}  // namespace test
