// The checks: tables of what a host has to do, each row with the function that finds out.

#pragma once

#include <span>

#include "hostcheck/CheckedHost.h"

namespace hostcheck {

/// The call of IFlashDevice2 during which a slot may be called, and so be checked.
enum class Stage { Creation, Initialize, Operation, Load };

struct Check {
    Stage stage;
    const char* slot;
    const char* expected;
    /// Returns a remark for a check that holds, mostly none. Throws Breach or NotChecked.
    std::string (*run)(CheckedHost& host);
};

std::span<const Check> SettingChecks();
std::span<const Check> MemoryChecks();
std::span<const Check> DisplayChecks();
std::span<const Check> TargetChecks();

}  // namespace hostcheck
