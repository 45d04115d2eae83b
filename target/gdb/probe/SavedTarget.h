// SavedTarget: what a debugger has on the target, as a value, while the target does something else:
// the core's registers, some of its memory, breakpoints, the chosen threads.
//
// It is taken when it is made, and the breakpoints are taken out. Until PutBack, the debugger sees
// and changes the value in place of that memory.

#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "base/AddressRange.h"
#include "target/gdb/client/GdbTarget.h"

namespace target::gdb {

/// What a debugger has asked the server for that it doesn't ask again.
struct DebuggerRequests {
    std::map<std::string, std::string> breakpoints;  ///< the request by "KIND,ADDRESS,SIZE"
    std::map<char, std::string> threads;             ///< by what they were chosen for: 'g', 'c'
};

class SavedTarget {
  public:
    /// Of a stopped target. TargetError, here and below.
    SavedTarget(GdbTarget& probe, const std::vector<base::AddressRange>& memory,
                DebuggerRequests requests);

    /// Ends the object's use.
    void PutBack();

    bool Touches(const base::AddressRange& range) const;

    /// Puts what is saved over what was read, and a write into what is saved.
    void Overlay(std::uint32_t address, std::string& bytes) const;
    void Write(std::uint32_t address, std::string_view bytes);

    /// Whether all of a range is saved.
    bool Holds(const base::AddressRange& range) const;

  private:
    struct Block {
        std::uint32_t address;
        std::string bytes;
    };

    void Take(const std::vector<base::AddressRange>& memory);
    std::map<unsigned, std::string> ReadRegisters(unsigned first);
    void FindGeneralRegisters();
    std::optional<unsigned> WriteRegisters(bool allAtOnce);

    GdbTarget& probe_;
    const DebuggerRequests requests_;
    std::vector<Block> memory_;                  ///< they don't overlap
    std::map<unsigned, std::string> registers_;  ///< values as the server writes them, by number
    std::string general_;  ///< the same for those that "g" reads all at once, or nothing
    unsigned firstOther_ = 0;
};

}  // namespace target::gdb
