// A debugger's load through added flash beside the tool's own.

#pragma once

#include "bench/Table.h"

namespace bench {

/// Runs stock GDB and the built tool, in real time. std::runtime_error when one of them fails.
Table AddedFlashTable();

}  // namespace bench
