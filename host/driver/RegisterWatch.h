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

/// What a run has done to the user registers, so far as it can know.
struct UserRegisterWork {
    bool accessed = false;  ///< the run had to do with them at all
    std::array<UserRegister, 2> registers;
};

class RegisterWatch {
  public:
    /// To be called before an access goes out.
    void Accessing(std::uint32_t address);
    void Writing(std::uint32_t address, std::uint32_t word);

    /// To be called when a read was answered.
    void Read(std::uint32_t address, std::uint32_t word);

    const std::optional<std::uint32_t>& Identification() const { return identification_; }
    const UserRegisterWork& UserRegisters() const { return work_; }

  private:
    std::optional<std::uint32_t> identification_;
    UserRegisterWork work_;
    std::uint32_t operand_ = 0;  ///< what the flash address register was given last
    std::optional<unsigned> committing_;
};

/// That a commit was begun and not seen to end; empty when none was.
std::string UnendedCommit(const UserRegisterWork& work);

/// What each register was found to hold; nothing for one that can't be read.
using RegisterValues = std::array<std::optional<std::uint32_t>, 2>;

/// What became of the registers, in a sentence and for the JSON lines.
std::string Describe(const UserRegisterWork& work, const RegisterValues& values);
Json ToJson(const UserRegisterWork& work, const RegisterValues& values);

}  // namespace host
