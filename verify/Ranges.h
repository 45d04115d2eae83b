// Reading a range of flash in chunks, for what looks at every byte of it.

#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "plugin/HostAccess.h"

/// Takes the first `count` bytes of the buffer, which the target holds at `address`. False ends the
/// reading.
using ChunkConsumer = std::function<bool(const std::vector<std::uint8_t>& buffer,
                                         std::uint32_t count, std::uint32_t address)>;

/// Hands the bytes from `start` to `end`, which belongs to the range, to the consumer in ascending
/// order, and reports the percentage under `text` before each read. False when the consumer ended
/// it. Throws std::runtime_error with the host's error text.
bool ReadRangeInChunks(const HostAccess& host, const ProgressHandle& progress,
                       const std::string& text, std::uint32_t start, std::uint32_t end,
                       const ChunkConsumer& consumer);
