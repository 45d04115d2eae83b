// What the register and MAC address commands share: reading a user register through the plug-in,
// and what is said about a commit.

#pragma once

#include <cstdint>

#include "host/output/Reporter.h"

namespace host {

class FlashDevice;

/// The register's value, by the plug-in's own read operation.
std::uint32_t ReadRegister(FlashDevice& device, unsigned index);

/// Makes the outcome a failure (ContentsDiffer) when the register read back isn't as programmed.
void RequireRegister(Outcome& outcome, unsigned index, std::uint32_t expected,
                     std::uint32_t actual);

void SayWhetherCommitted(Reporter& reporter, bool committed);

}  // namespace host
