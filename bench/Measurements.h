// The tables that script/bench prints.

#pragma once

#include "bench/Table.h"

namespace bench {

/// Host calls by kind beside the least that the device's protocol allows.
Table CountsTable();

/// A program load on one virtual clock, by link and by the loader's speed.
Table ModelledTimeTable();

/// A program load under a host that waits for the loader, and under one that doesn't, beside what
/// link and flash need.
Table ToolTable();

/// What another section costs beside another sector.
Table StartsTable();

/// What a chunk and a look at the loader cost behind a GDB server.
Table PacketsTable();

/// The plug-in's processor time beside that of its host calls alone.
Table OwnWorkTable();

/// The same by size, up to the largest flash.
Table GrowthTable();

/// Bytes a second of the reading operations beside the library functions that do the same.
Table ThroughputTable();

}  // namespace bench
