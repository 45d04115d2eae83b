// What the register and MAC address commands share: reading a user register through the plug-in,
// choosing whether a value is committed, and reading both back.

#pragma once

#include <cstdint>

#include "host/driver/RegisterWatch.h"
#include "host/output/Reporter.h"
#include "host/settings/SettingStore.h"

namespace host {

class FlashDevice;

/// The register's value, by the plug-in's own read operation.
std::uint32_t ReadRegister(FlashDevice& device, unsigned index);

/// The value that the read operation just run has published.
std::uint32_t PublishedRegister(const FlashDevice& device, unsigned index);

/// Whether the programming to come commits its value: when that was `asked` for, or else when the
/// setting `key` says so, which is then shown with where it comes from.
void ChooseCommit(SettingStore& settings, Reporter& reporter, const char* key, bool asked);

/// Reads both registers after a programming operation that reported success, and puts what they
/// hold into the outcome. It is a failure (ContentsDiffer) when one isn't as expected; where
/// nothing is, the register needn't be anything.
RegisterValues CheckRegisters(FlashDevice& device, const RegisterValues& expected,
                              Outcome& outcome);

/// Says so, and puts it into the outcome: whether all that was programmed was seen to be committed.
void SayWhetherCommitted(Reporter& reporter, const UserRegisterWork& work, Outcome& outcome);

}  // namespace host
