// ELF: the program that a linker has made for the device, from the bytes of its file.
//
// The devices are 32-bit, little-endian Arm cores without an operating system, so that a program
// is an executable that is linked to fixed addresses. Nothing in the file is taken for granted:
// whatever it announces must lie inside of it.

#pragma once

#include <cstdint>
#include <stdexcept>
#include <string_view>
#include <vector>

namespace base {

/// What is wrong with a file, and what to do; a sentence without its subject, the file.
class ElfError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// A segment to be loaded, of one byte at least.
struct ElfSegment {
    unsigned number;            ///< its place in the program header table
    std::uint32_t address;      ///< the physical one, where it is loaded
    std::string_view bytes;     ///< those that stand in the file; they belong to its contents
    std::uint32_t memoryBytes;  ///< with the zeros that follow them in memory
};

struct ElfProgram {
    std::uint32_t entry = 0;
    std::vector<ElfSegment> segments;  ///< in the order of the file
};

/// Whether contents claim to be an ELF file.
bool LooksLikeElf(std::string_view contents);

/// Throws ElfError. The segments point into `contents`.
ElfProgram ReadElf(std::string_view contents);

}  // namespace base
