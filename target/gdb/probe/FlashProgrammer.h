// FlashProgrammer: what a probe with flash added must be able to ask for: that flash is erased and
// written, and that this is done. How it is done is the host's business.
//
// Erases and writes are collected. Sectors that nobody is expected to write any more are programmed
// in between (Work), the rest at the end (Done), which also means that all of it was compared.
// After a failure nothing is collected any more, and Done fails, until the next erase begins a new
// load.
//
// All operations may throw TargetError, whose text is for whoever runs the server; one that refuses
// a request has changed nothing. The core is stopped. Of the target, only Work and Done change
// anything: the flash, the core's registers, and the memory that Scratch tells.

#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "base/AddressRange.h"
#include "target/gdb/server/ServedDevice.h"
#include "target/gdb/wire/Socket.h"

namespace target::gdb {

class FlashProgrammer {
  public:
    virtual ~FlashProgrammer() = default;

    virtual MemoryRegion Flash() const = 0;
    virtual std::vector<base::AddressRange> Scratch() = 0;

    /// Whole sectors. What was collected for them is forgotten.
    virtual void Erase(std::uint32_t address, std::uint32_t sizeBytes) = 0;

    /// Into flash that is to be erased, or is blank.
    virtual void Write(std::uint32_t address, std::string_view bytes) = 0;

    /// Whether so much can be programmed already that it is worth it.
    virtual bool HasWork() const = 0;

    /// These end soon, with an error, once `stop` is true.
    virtual void Work(const InterruptCheck& stop) = 0;
    virtual void Done(const InterruptCheck& stop) = 0;

    /// Whether a range holds bytes that are collected and not programmed yet.
    virtual bool Touches(const base::AddressRange& range) const = 0;

    /// Puts what is collected over what was read of the flash.
    virtual void Overlay(std::uint32_t address, std::string& bytes) const = 0;

    /// Nobody will say Done. What is to be told of it; nothing when nothing was begun.
    virtual std::string Abandon() = 0;

    /// What was done last, in lines.
    virtual std::string Report() const = 0;
};

}  // namespace target::gdb
