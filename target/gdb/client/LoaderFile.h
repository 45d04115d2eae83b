// LoaderFile: a program for the target's RAM, from an ELF file.

#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace target::gdb {

struct LoaderFile {
    struct Segment {
        std::uint32_t address;
        std::string bytes;  ///< those without contents in the file are zeros
    };

    std::vector<Segment> segments;
    std::uint32_t entry = 0;
};

/// Throws the TargetError that names the file and why it can't be used.
[[noreturn]] void RefuseLoader(const std::string& path, const std::string& why);

/// Reads a 32-bit, little-endian ARM executable of at most a few MiB. TargetError names the file
/// and what is wrong with it.
LoaderFile ReadLoaderFile(const std::string& path);

}  // namespace target::gdb
