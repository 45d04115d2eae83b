// The rows of the option table and how each value is taken in.

#include "target/simulated/options/OptionTable.h"

#include <fmt/format.h>

#include <bit>

#include "base/Duration.h"
#include "base/Hex.h"
#include "target/simulated/options/OptionValues.h"

namespace target {

namespace {

using std::string_view;

// A row's `set` changes the member that it is for, and nothing else, when it takes the text; when
// it refuses, what it leaves there is of no account. Rows with a `definition` say what a device is
// and are kept with it: their order is the order in contents files. The others are of a run.

bool Store(std::optional<std::uint32_t> parsed, std::uint32_t& member) {
    if (parsed) member = *parsed;
    return parsed.has_value();
}

bool StoreSize(string_view text, std::uint64_t unit, std::uint64_t least, std::uint64_t most,
               std::uint32_t& member) {
    const auto size = ParseSize(text);
    if (!size || *size % unit != 0 || *size < least || *size > most) return false;
    member = static_cast<std::uint32_t>(*size);
    return true;
}

template <std::chrono::nanoseconds Timings::*Member>
bool SetTime(DeviceOptions& options, string_view text) {
    const auto duration = base::ParseDuration(text);
    if (duration) options.timings.*Member = *duration;
    return duration.has_value();
}

// 0 stands for none and can't be asked for.
template <std::uint64_t Faults::*Member>
bool SetAccessNumber(DeviceOptions& options, string_view text) {
    const auto number = ParseNumber(text);
    if (!number || *number == 0) return false;
    options.faults.*Member = *number;
    return true;
}

template <bool Faults::*Member>
bool SetNever(DeviceOptions& options, string_view text) {
    options.faults.*Member = text == "never";
    return options.faults.*Member;
}

// The revision is a part of the identification, which can also be given as a whole.
bool SetRevision(DeviceOptions& options, string_view text) {
    const auto revision = ParseRevision(text);
    if (!revision) return false;
    options.identification = (options.identification & 0xFFFF00FF) | std::uint32_t{*revision} << 8;
    return true;
}

// A power of two, for the register holds an exponent.
bool SetSector(DeviceOptions& options, string_view text) {
    std::uint32_t size = 0;
    if (!StoreSize(text, kKiB, kKiB, 128 * kKiB, size) || !std::has_single_bit(size)) return false;
    options.sectorSizeBytes = size;
    return true;
}

bool SetBandwidth(DeviceOptions& options, string_view text) {
    const auto bytesPerSecond = ParseSize(text);
    if (bytesPerSecond) options.timings.bytesPerSecond = *bytesPerSecond;
    return bytesPerSecond.has_value();
}

bool SetLoaderFault(DeviceOptions& options, string_view text) {
    options.faults.loader = text == "hangs"  ? LoaderFault::Hangs
                            : text == "dead" ? LoaderFault::Dead
                                             : LoaderFault::None;
    return options.faults.loader != LoaderFault::None;
}

bool SetRegisterFault(DeviceOptions& options, string_view text) {
    options.faults.registers = text == "ones"    ? RegisterFault::Ones
                               : text == "zeros" ? RegisterFault::Zeros
                                                 : RegisterFault::None;
    return options.faults.registers != RegisterFault::None;
}

// Without a byte it is stuck at 0.
bool SetStuckCell(DeviceOptions& options, string_view text) {
    const std::size_t colon = text.find(':');
    const auto address = base::ParseHex32(text.substr(0, colon));
    const auto value = colon == string_view::npos ? 0 : base::ParseHex32(text.substr(colon + 1));
    if (!address || !value || *value > 0xFF) return false;
    options.faults.stuckCell = StuckCell{*address, static_cast<std::uint8_t>(*value)};
    return true;
}

// Each is the end of the sentence "accepted is ...", and stands in the help.
constexpr char kTimeForm[] = "a whole number with ns, us, ms or s, up to an hour";
constexpr char kHexForm[] = "a hexadecimal number of up to 8 digits";

const OptionRow kRows[] = {
    {"id", kHexForm, "value of the identification register",
     [](DeviceOptions& o, string_view t) { return Store(base::ParseHex32(t), o.identification); },
     [](const DeviceOptions& o) { return RegisterText(o.identification); }},
    {"revision", "a letter from A to Z, or a number up to 255 (0 is A)", "major revision",
     SetRevision,
     [](const DeviceOptions& o) { return fmt::format("{}", o.identification >> 8 & 0xFF); }},
    {"flash", "a multiple of 2048 bytes up to 128M; K and M are understood", "flash size",
     [](DeviceOptions& o, string_view t) {
         return StoreSize(t, 2 * kKiB, 2 * kKiB, 128 * kKiB * kKiB, o.flashSizeBytes);
     },
     [](const DeviceOptions& o) { return FormatSize(o.flashSizeBytes); }},
    {"ram", "a multiple of 256 bytes from 8K to 16M; K and M are understood", "RAM size",
     [](DeviceOptions& o, string_view t) {
         return StoreSize(t, 256, 8 * kKiB, 16 * kKiB * kKiB, o.ramSizeBytes);
     },
     [](const DeviceOptions& o) { return FormatSize(o.ramSizeBytes); }},
    {"sector",
     "1K, 2K, 4K, 8K, 16K, 32K, 64K or 128K",
     "sector size; only on classes that report it (velk, dorna)",
     SetSector,
     [](const DeviceOptions& o) { return FormatSize(o.sectorSizeBytes); },
     {"1K", "2K", "4K", "8K", "16K", "32K", "64K", "128K"}},
    {"keyconfig", kHexForm, "value of the key configuration register",
     [](DeviceOptions& o, string_view t) { return Store(base::ParseHex32(t), o.keyConfiguration); },
     [](const DeviceOptions& o) { return RegisterText(o.keyConfiguration); }},
    {"erase-time", kTimeForm, "time that a sector erase takes", SetTime<&Timings::sectorErase>,
     nullptr},
    {"mass-erase-time", kTimeForm, "time that a mass erase takes", SetTime<&Timings::massErase>,
     nullptr},
    {"commit-time", kTimeForm, "time that a user-register commit takes", SetTime<&Timings::commit>,
     nullptr},
    {"chunk-time", kTimeForm, "time that the loader needs for a chunk", SetTime<&Timings::chunk>,
     nullptr},
    {"latency", kTimeForm, "cost of an access over the debug link", SetTime<&Timings::latency>,
     nullptr},
    {"bandwidth", "bytes a second; K and M are understood, 0 is unlimited",
     "speed of the debug link", SetBandwidth, nullptr},
    {"fail-access", "a number from 1", "fault: this access fails",
     SetAccessNumber<&Faults::failAccess>, nullptr},
    {"fail-from", "a number from 1", "fault: this access and all later ones fail",
     SetAccessNumber<&Faults::failFrom>, nullptr},
    {"erase",
     "never",
     "fault: an erase never ends",
     SetNever<&Faults::eraseNeverEnds>,
     nullptr,
     {"never"}},
    {"commit",
     "never",
     "fault: a commit never ends",
     SetNever<&Faults::commitNeverEnds>,
     nullptr,
     {"never"}},
    {"loader",
     "hangs or dead",
     "fault: the loader finishes no chunk, or doesn't even start",
     SetLoaderFault,
     nullptr,
     {"hangs", "dead"}},
    {"registers",
     "ones or zeros",
     "fault: all registers read so, and writes to them are lost",
     SetRegisterFault,
     nullptr,
     {"ones", "zeros"}},
    {"stuck-cell", "ADDRESS or ADDRESS:BYTE, hexadecimal",
     "fault: this byte of flash always reads BYTE, or 0", SetStuckCell, nullptr},
};

}  // namespace

std::span<const OptionRow> OptionTable() {
    return kRows;
}

std::string RegisterText(std::uint32_t value) {
    return fmt::format("{:#010x}", value);
}

}  // namespace target
