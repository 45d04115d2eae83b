// Writing the two documents.

#include "target/gdb/server/Documents.h"

#include <fmt/format.h>

#include <algorithm>

#include "target/gdb/wire/Frame.h"

namespace target::gdb {

// GDB knows the microcontroller profile by the feature's name, and by the registers in this order.
std::string RegistersDocument() {
    std::string text =
        "<?xml version=\"1.0\"?>\n<!DOCTYPE target SYSTEM \"gdb-target.dtd\">\n"
        "<target version=\"1.0\">\n<architecture>arm</architecture>\n"
        "<feature name=\"org.gnu.gdb.arm.m-profile\">\n";
    for (std::size_t i = 0; i < CoreRegisters::kSp; ++i)
        text += fmt::format("<reg name=\"r{0}\" bitsize=\"32\" regnum=\"{0}\"/>\n", i);
    return text +
           "<reg name=\"sp\" bitsize=\"32\" regnum=\"13\" type=\"data_ptr\"/>\n"
           "<reg name=\"lr\" bitsize=\"32\" regnum=\"14\"/>\n"
           "<reg name=\"pc\" bitsize=\"32\" regnum=\"15\" type=\"code_ptr\"/>\n"
           "<reg name=\"xpsr\" bitsize=\"32\" regnum=\"16\"/>\n"
           "</feature>\n</target>\n";
}

std::string MemoryDocument(const std::vector<MemoryRegion>& regions) {
    std::string text =
        "<?xml version=\"1.0\"?>\n<!DOCTYPE memory-map PUBLIC \"+//IDN gnu.org//DTD GDB Memory "
        "Map V1.0//EN\" \"http://sourceware.org/gdb/gdb-memory-map.dtd\">\n<memory-map>\n";
    for (const MemoryRegion& region : regions) {
        const bool flash = region.sectorSizeBytes != 0;
        text += fmt::format(R"(<memory type="{}" start="0x{:x}" length="0x{:x}")",
                            flash ? "flash" : "ram", region.address, region.sizeBytes);
        text += flash ? fmt::format("><property name=\"blocksize\">0x{:x}</property></memory>\n",
                                    region.sectorSizeBytes)
                      : "/>\n";
    }
    return text + "</memory-map>\n";
}

std::string DocumentReply(const std::string& document, const Arguments& piece,
                          std::size_t packetSize) {
    const std::size_t offset = std::min<std::size_t>(piece.address, document.size());
    const std::size_t size = std::min<std::size_t>(piece.length, (packetSize - 1) / 2);
    const bool last = document.size() - offset <= size;
    return (last ? "l" : "m") + Escaped(std::string_view(document).substr(offset, size));
}

}  // namespace target::gdb
