// The XML documents that the server hands out: its core's registers, its device's memory.

#pragma once

#include <string>
#include <vector>

#include "target/gdb/server/Arguments.h"
#include "target/gdb/server/ServedDevice.h"

namespace target::gdb {

std::string RegistersDocument();
std::string MemoryDocument(const std::vector<MemoryRegion>& regions);

/// The answer to a request for a piece of a document, in a packet of at most that size.
std::string DocumentReply(const std::string& document, const Arguments& piece,
                          std::size_t packetSize);

}  // namespace target::gdb
