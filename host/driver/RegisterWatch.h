// What is known of the device's registers from the accesses that go by in the host's slots: its
// identification, and what was done to the two user registers.

#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <string>

#include "host/base/Json.h"

namespace host {

/// A commit that was begun and not seen to end may have taken place or not.
enum class Commit { None, Begun, Done };

struct UserRegister {
    /// What was written, or may have been: the answer to a write can be lost.
    std::optional<std::uint32_t> written;
    Commit commit = Commit::None;
};

class RegisterWatch {
  public:
    /// To be called before an access goes out.
    void Accessing(std::uint32_t address);
    void Writing(std::uint32_t address, std::uint32_t word);

    /// To be called when a read was answered.
    void Read(std::uint32_t address, std::uint32_t word);

    const std::optional<std::uint32_t>& Identification() const { return identification_; }
    const UserRegister& Of(unsigned index) const { return registers_[index]; }

    /// Whether this run had to do with the user registers at all.
    bool UserRegistersAccessed() const { return accessed_; }

  private:
    std::optional<std::uint32_t> identification_;
    std::array<UserRegister, 2> registers_;
    std::uint32_t operand_ = 0;  ///< what the flash address register was given last
    std::optional<unsigned> committing_;
    bool accessed_ = false;
};

/// What each register was found to hold; nothing for one that can't be read.
using RegisterValues = std::array<std::optional<std::uint32_t>, 2>;

/// What became of the registers, in a sentence and for the JSON lines.
std::string Describe(const RegisterWatch& watch, const RegisterValues& values);
Json ToJson(const RegisterWatch& watch, const RegisterValues& values);

}  // namespace host
