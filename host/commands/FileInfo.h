// What an image file holds, without a device.

#pragma once

#include "host/commands/Context.h"
#include "host/commands/SharedOptions.h"

namespace host::commands {

/// A block of lines for each file, and an object in the outcome. Failure as in reading a file.
Outcome ShowFiles(Context& context, const ImageFiles& files);

}  // namespace host::commands
