// The XML documents that the server hands out: its core's registers, its device's memory.

#pragma once

#include <string>
#include <vector>

#include "target/gdb/ServedDevice.h"

namespace target::gdb {

std::string TargetDescription();
std::string MemoryMapDocument(const std::vector<MemoryRegion>& regions);

}  // namespace target::gdb
