// What can't be found out from inside, told at the end of each part, so that nobody takes a check
// that holds for a host that works.

#pragma once

namespace hostcheck {

inline constexpr char kUnseenAtStart[] =
    "Not seen by this check: whether settings are what your user chose and outlive a run; whether "
    "other registers are reached than the two that were tried; "
    "what a dropped connection does.";

inline constexpr char kUnseenInDisplays[] =
    "Not seen by this check: whether messages, errors and displays appear, and in time; whether "
    "your user can cancel. Run CheckShownError and CheckReturnedError: after both your host has to "
    "say that the operation failed.";

inline constexpr char kUnseenInALoad[] =
    "Not seen by this check: whether the sections are those of your image and all of them, and "
    "whether you read back and compare. The loader's work is checked by the operation CheckLoader. "
    "ResetSettings(2) has to follow after the last section.";

inline constexpr char kUnseenInTheLoader[] =
    "Not seen by this check: whether the loader programs other bytes than 0xFF, in every sector of "
    "the flash; whether your host gives a loader up that hangs; how fast all of it is.";

}  // namespace hostcheck
