// ServedDevice: what the GDB server must be able to ask of the device that it serves. All
// operations may throw TargetError; its text is for whoever runs the server.

#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "target/Target.h"

namespace target::gdb {

struct MemoryRegion {
    std::uint32_t address;
    std::uint32_t sizeBytes;
    std::uint32_t sectorSizeBytes;  ///< of flash; 0 for everything else
};

/// The registers of the core, in the order in which the target description lists them.
struct CoreRegisters {
    static constexpr std::size_t kCount = 17;
    static constexpr std::size_t kSp = 13;
    static constexpr std::size_t kPc = 15;
    static constexpr std::size_t kStatus = 16;

    std::uint32_t values[kCount] = {};
};

class ServedDevice {
  public:
    virtual ~ServedDevice() = default;

    /// The memory, in the order of addresses.
    virtual std::vector<MemoryRegion> Regions() const = 0;

    /// One access; `width` is 4 for an aligned range of whole words, else 1.
    virtual std::string Read(std::uint32_t address, std::size_t sizeBytes, std::size_t width) = 0;
    virtual void Write(std::uint32_t address, std::string_view bytes, std::size_t width) = 0;

    /// By the rules of the cells: an erase sets whole sectors to ones, programming clears bits.
    virtual void EraseFlash(std::uint32_t address, std::uint32_t sizeBytes) = 0;
    virtual void ProgramFlash(std::uint32_t address, std::string_view bytes) = 0;

    virtual CoreRegisters& Registers() = 0;

    virtual void Start() = 0;  ///< at the program counter
    virtual void Stop() = 0;   ///< also a stopped one
    virtual bool IsRunning() const = 0;
    virtual void Reset() = 0;  ///< and stop

    /// A client has gone: what must outlive the server is kept.
    virtual void ClientGone() = 0;
};

}  // namespace target::gdb
