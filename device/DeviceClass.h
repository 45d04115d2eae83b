// The codes of the device classes.

#pragma once

#include <cstdint>

namespace DeviceClass {

inline constexpr std::int32_t Unknown = -1;
inline constexpr std::int32_t Ravik = 0;
inline constexpr std::int32_t TolvaRevA = 1;
inline constexpr std::int32_t TolvaRevB = 2;
inline constexpr std::int32_t MeskRevA = 3;
inline constexpr std::int32_t MeskRevB = 4;
inline constexpr std::int32_t Orrin = 5;
inline constexpr std::int32_t Pell = 6;
inline constexpr std::int32_t Quen = 7;
inline constexpr std::int32_t Velk = 9;
inline constexpr std::int32_t Dorna = 10;

}  // namespace DeviceClass
