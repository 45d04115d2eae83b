// The XML documents that the server hands out: its core's registers, its device's memory.

#pragma once

#include <string>
#include <vector>

#include "target/gdb/server/ServedDevice.h"

namespace target::gdb {

std::string RegistersDocument();
std::string MemoryDocument(const std::vector<MemoryRegion>& regions);

}  // namespace target::gdb
