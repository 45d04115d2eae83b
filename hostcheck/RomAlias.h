// After a reset, devices with a ROM show it where flash begins, until their ROM control register is
// written.

#pragma once

#include "hostcheck/CheckedHost.h"

namespace hostcheck {

/// Whether there is a ROM, and it lies over the flash.
bool RomLiesOverFlash(const CheckedHost& host);

/// Lets the flash be seen again. Does nothing where there is no ROM. Breach when a slot fails.
void ClearRomAlias(const CheckedHost& host);

}  // namespace hostcheck
