// Reading parts of the flash as one phase of a run.

#pragma once

#include "base/AddressSet.h"
#include "host/driver/FlashReader.h"
#include "host/image/Image.h"
#include "host/output/WorkMeter.h"

namespace host {

/// The target must be halted. Failure when flash can't be read.
image::Image ReadRanges(FlashReader& reader, WorkMeter& meter, Phase phase,
                        const base::AddressSet& ranges);

}  // namespace host
