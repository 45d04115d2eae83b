// The codes of the device classes.

#pragma once

#include <cstdint>

enum class DeviceClass : std::int32_t {
    Unknown = -1,
    Ravik = 0,
    TolvaRevA = 1,
    TolvaRevB = 2,
    MeskRevA = 3,
    MeskRevB = 4,
    Orrin = 5,
    Pell = 6,
    Quen = 7,
    Velk = 9,
    Dorna = 10,
};
