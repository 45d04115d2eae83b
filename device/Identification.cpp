// Building the device record: which class is connected, and how much flash and RAM it has.

#include "device/FlashCorvane.h"
#include "device/RegisterMap.h"
#include "plugin/Trace.h"

namespace {

constexpr std::uint32_t kAnyRevision = 0xFFFFFFFF;

struct ClassRow {
    std::uint32_t classField;
    std::uint32_t majorRevision;
    DeviceClass code;
    const char* name;
};

constexpr ClassRow kClassRows[] = {
    {1, 0, DeviceClass::TolvaRevA, "Tolva Rev.A"},   {1, 1, DeviceClass::TolvaRevB, "Tolva Rev.B"},
    {3, 0, DeviceClass::MeskRevA, "Mesk Rev.A"},     {3, 1, DeviceClass::MeskRevB, "Mesk Rev.B"},
    {4, kAnyRevision, DeviceClass::Orrin, "Orrin"},  {5, kAnyRevision, DeviceClass::Quen, "Quen"},
    {6, kAnyRevision, DeviceClass::Pell, "Pell"},    {9, kAnyRevision, DeviceClass::Velk, "Velk"},
    {10, kAnyRevision, DeviceClass::Dorna, "Dorna"},
};

constexpr ClassRow kRavikRow = {0, kAnyRevision, DeviceClass::Ravik, "Ravik"};
constexpr ClassRow kUnknownRow = {0, kAnyRevision, DeviceClass::Unknown, ""};

std::uint32_t ClassField(std::uint32_t identification) {
    return (identification >> 16) & 0xFF;
}

// A class without a row counts as Ravik; a class whose rows stop short of the revision does not,
// for nothing is known of how that revision wants to be handled.
const ClassRow& FindClass(std::uint32_t classField, std::uint32_t majorRevision) {
    bool classKnown = false;
    for (const ClassRow& row : kClassRows) {
        if (row.classField != classField) continue;
        classKnown = true;
        if (row.majorRevision == kAnyRevision || row.majorRevision == majorRevision) return row;
    }
    return classKnown ? kUnknownRow : kRavikRow;
}

}  // namespace

FlashCorvane::FlashCorvane(std::string variant, const std::string& /*text2*/,
                           const std::string& /*text3*/, IFlashHost* host)
    : p_mHost(host), p_mVariant(std::move(variant)) {
    TRACE(Entry, "FlashCorvane Constructor, variant = %s", p_mVariant.c_str());
    IdentifyClass(p_mHost.ReadWord(Register::DeviceIdentification0));
    TRACE(Information, "FlashCorvane Constructor, Part = %d", static_cast<int>(p_mClassRev));

    p_mHost.HaltTarget();
    p_mHost.ReadWord(Register::ClockConfiguration);
    ReadSizes();
    if (p_mClassRev == DeviceClass::Velk) p_mFlashSize = 0;
    TRACE(Information, "FlashCorvane Constructor, Flash size = 0x%08X", p_mFlashSize);
    TRACE(Information, "FlashCorvane Constructor, Flash sector = 0x%08X", p_mSectorSize);
    TRACE(Information, "FlashCorvane Constructor, RAM size = 0x%08X", p_mRAMSize);

    p_mUseFlashBuffer = (p_mHost.ReadWord(Register::FlashBufferCapability) & 1) != 0;
    TRACE(Information, "FlashCorvane Constructor, Use Flash Buffer = %u",
          static_cast<unsigned>(p_mUseFlashBuffer));
    TRACE(Result, "FlashCorvane Constructor");
}

void FlashCorvane::IdentifyClass(std::uint32_t identification) {
    // Newer identification values use bits 23 to 20 for something else.
    if ((identification & 0x80000000) != 0) identification &= 0xFF0FFFFF;
    const ClassRow& row = FindClass(ClassField(identification), (identification >> 8) & 0xFF);
    p_mClassRev = row.code;
    p_mFamily = row.name;
}

// The sizes go by the class field as the register has it, bits 23 to 20 included, unlike the class.
void FlashCorvane::ReadSizes() {
    const std::uint32_t rawClassField =
        ClassField(p_mHost.ReadWord(Register::DeviceIdentification0));
    std::uint32_t flashField = 0;
    std::uint32_t sramField = 0;
    if (rawClassField < 8) {
        const std::uint32_t capabilities = p_mHost.ReadWord(Register::DeviceCapabilities0);
        flashField = capabilities & 0xFFFF;
        sramField = capabilities >> 16;
        p_mSectorSize = 1024;
    } else {
        const std::uint32_t flashSize = p_mHost.ReadWord(Register::FlashSize);
        flashField = flashSize & 0xFFFF;
        sramField = p_mHost.ReadWord(Register::SramSize);
        p_mSectorSize = 1024u << ((flashSize >> 16) & 7);
    }
    p_mFlashSize = (flashField + 1) * 2048;
    p_mRAMSize = (sramField + 1) * 256;
}

bool FlashCorvane::FlashAvailable() const {
    TRACE(Entry, "FlashCorvane::FlashAvailable()");
    const bool available = p_mFlashSize != 0;
    TRACE(Result, "FlashCorvane::FlashAvailable() = %u", static_cast<unsigned>(available));
    return available;
}

// The two address queries trace their results at the level of their entries: a host asks them for
// every address it draws, and the pair should be switched on and off together.
bool FlashCorvane::AddressWithinFlash(std::uint32_t address) const {
    TRACE(Entry, "FlashCorvane::AddressWithinFlash(0x%08X)", address);
    const bool within = address < p_mFlashSize;
    TRACE(Entry, "FlashCorvane::AddressWithinFlash() = %u", static_cast<unsigned>(within));
    return within;
}

bool FlashCorvane::AddressWithinFlash(std::uint32_t address, std::int32_t size) const {
    TRACE(Entry, "FlashCorvane::AddressWithinFlash(0x%08X,%d)", address, size);
    const std::uint32_t behind = address + static_cast<std::uint32_t>(size);
    const bool within = address < p_mFlashSize && behind < p_mFlashSize;
    TRACE(Entry, "FlashCorvane::AddressWithinFlash() = %u", static_cast<unsigned>(within));
    return within;
}
