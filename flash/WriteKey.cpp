// The flash controller carries out a command only when it comes with the device's write key.

#include "device/FlashCorvane.h"
#include "device/RegisterMap.h"

namespace {

constexpr std::uint32_t kPrimaryWriteKey = 0xA442;
constexpr std::uint32_t kAlternateWriteKey = 0x71D5;

// A register that reads as all zeros is not there, so it cannot select the alternate key.
std::uint32_t WriteKey(std::uint32_t keyConfiguration, DeviceClass classRev) {
    const bool alternate =
        (keyConfiguration & 0x10) == 0 && classRev >= DeviceClass::Quen && keyConfiguration != 0;
    return alternate ? kAlternateWriteKey : kPrimaryWriteKey;
}

}  // namespace

std::uint32_t FlashCorvane::KeyedCommand(std::uint32_t command) const {
    const std::uint32_t keyConfiguration = p_mHost.ReadWord(Register::KeyConfiguration);
    return WriteKey(keyConfiguration, p_mClassRev) << 16 | command;
}
