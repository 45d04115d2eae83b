// The checks: tables of what a host has to do, each row with the function that finds out.

#pragma once

#include <span>
#include <string>

#include "hostcheck/CheckedHost.h"

namespace hostcheck {

/// When a slot may be called, and so be checked. The stages of the loader run in this order, each
/// by itself, whatever came of the one before.
enum class Stage {
    Creation,     ///< during CreateFlashDevice2
    Initialize,   ///< during Initialize
    Display,      ///< in an operation
    LoadBegins,   ///< in the first WriteDataToFlash of a load
    LoaderStart,  ///< in that and in CheckLoader
    LoaderWork,   ///< in CheckLoader alone
    LoaderEnd,    ///< in both
};

struct Check {
    Stage stage;
    const char* slot;
    const char* expected;
    /// Returns what was seen, for a check that holds and has more to say than that. Throws Breach
    /// or NotChecked.
    std::string (*run)(CheckedHost& host);
};

// Each in the order in which they run, and in the order in which the stages come to them.
std::span<const Check> SettingChecks();
std::span<const Check> PropertyChecks();
std::span<const Check> RegisterChecks();
std::span<const Check> RamChecks();
std::span<const Check> FlashChecks();
std::span<const Check> RefusalChecks();
std::span<const Check> CoreChecks();
std::span<const Check> PauseChecks();
std::span<const Check> LoaderStartChecks();
std::span<const Check> LoaderWorkChecks();
std::span<const Check> DisplayChecks();

}  // namespace hostcheck
