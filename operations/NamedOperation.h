// One row of the table of operations: all that tells an operation from the others.

#pragma once

#include <cstdint>

#include "device/FlashCorvane.h"

/// What an operation on the user registers does, and with which of them.
enum class RegisterAccess : std::uint8_t { Read, Program };
enum class RegisterChoice : std::uint8_t { Register0 = 0, Register1 = 1, MACAddress };

struct FlashCorvane::NamedOperation {
    const char* name;
    void (FlashCorvane::*run)(const NamedOperation& operation);

    // The step that an operation on flash ends with, or consists of.
    const char* statusText = nullptr;  ///< shown before it
    const char* errorText = nullptr;   ///< shown when it has failed
    bool (FlashCorvane::*step)() = nullptr;

    // Of an operation on the user registers.
    RegisterAccess access = {};
    RegisterChoice choice = {};

    bool listed = true;  ///< in the text that hosts show to their users
};
