// The table of the device classes and what follows from an identification value.

#include "target/simulated/options/DeviceClass.h"

#include <algorithm>

namespace target {

namespace {

// What a driver sees is the identification alone. An option may change it so that it no longer fits
// the class: then registers go by the class, and sizes and ROM by what is seen.

std::uint32_t ClassField(const DeviceOptions& options) {
    return (options.identification >> 16) & 0xFFU;
}

std::uint32_t MajorRevision(const DeviceOptions& options) {
    return (options.identification >> 8) & 0xFFU;
}

}  // namespace

const std::vector<DeviceClass>& DeviceClasses() {
    // Dorna's identification shows the long form: bit 31 set, the class in four bits only. Velk
    // and Dorna ask for the alternate write key (bit 4 of the key configuration clear).
    static const std::vector<DeviceClass> classes = {
        {DeviceKind::Ravik, "ravik", 0x00000202, 64 * kKiB, 8 * kKiB, 1 * kKiB, 0xFFFFFFFF},
        {DeviceKind::Tolva, "tolva", 0x10010100, 256 * kKiB, 64 * kKiB, 1 * kKiB, 0xFFFFFFFF},
        {DeviceKind::Mesk, "mesk", 0x10030100, 128 * kKiB, 64 * kKiB, 1 * kKiB, 0xFFFFFFFF},
        {DeviceKind::Orrin, "orrin", 0x10040101, 256 * kKiB, 64 * kKiB, 1 * kKiB, 0xFFFFFFFF},
        {DeviceKind::Pell, "pell", 0x10060000, 256 * kKiB, 64 * kKiB, 1 * kKiB, 0xFFFFFFFF},
        {DeviceKind::Quen, "quen", 0x10050000, 512 * kKiB, 64 * kKiB, 1 * kKiB, 0xFFFFFFFF},
        {DeviceKind::Velk, "velk", 0x10090000, 512 * kKiB, 64 * kKiB, 4 * kKiB, 0xFFFFFFEF},
        {DeviceKind::Dorna, "dorna", 0x901A0000, 1024 * kKiB, 256 * kKiB, 16 * kKiB, 0xFFFFFFEF},
    };
    return classes;
}

const DeviceClass* FindDeviceClass(std::string_view name) {
    const auto& classes = DeviceClasses();
    const auto found = std::find_if(classes.begin(), classes.end(),
                                    [name](const DeviceClass& row) { return row.name == name; });
    return found == classes.end() ? nullptr : &*found;
}

DeviceKind KindOf(const DeviceOptions& options) {
    const DeviceClass* found = FindDeviceClass(options.className);
    if (found == nullptr) throw OptionError("No device class \"" + options.className + "\".");
    return found->kind;
}

bool HasSizeRegisters(const DeviceOptions& options) {
    return ClassField(options) >= 8;
}

bool HasRom(const DeviceOptions& options) {
    const std::uint32_t field = ClassField(options);
    return field >= 3 || (field == 1 && MajorRevision(options) >= 1);
}

bool NeedsFlashSetUp(const DeviceOptions& options) {
    const DeviceKind kind = KindOf(options);
    return kind == DeviceKind::Ravik || (kind <= DeviceKind::Mesk && MajorRevision(options) <= 1);
}

bool NeedsClockFixUp(const DeviceOptions& options) {
    return KindOf(options) == DeviceKind::Orrin && options.identification == 0x10040101;
}

}  // namespace target
