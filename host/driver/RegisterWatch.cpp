// Reading identification, register writes and commits off the accesses.

#include "host/driver/RegisterWatch.h"

#include <fmt/format.h>

#include <algorithm>

#include "host/facts/FlashMemory.h"

namespace host {

namespace {

std::optional<unsigned> IndexOf(std::uint32_t address) {
    const auto& all = plugin::kUserRegisters;
    const auto* found = std::find(all.begin(), all.end(), address);
    if (found == all.end()) return std::nullopt;
    return static_cast<unsigned>(found - all.begin());
}

}  // namespace

void RegisterWatch::Accessing(std::uint32_t address) {
    if (IndexOf(address)) work_.accessed = true;
}

void RegisterWatch::Writing(std::uint32_t address, std::uint32_t word) {
    if (const auto index = IndexOf(address)) work_.registers[*index] = {word, Commit::None};
    if (address == plugin::kFlashAddressRegister) operand_ = word;
    if (address != plugin::kFlashCommandRegister || (word & plugin::kCommitBit) == 0) return;
    const std::uint32_t index = operand_ - plugin::kCommitOperand;
    if (index >= work_.registers.size()) return;
    committing_ = index;
    work_.registers[index].commit = Commit::Begun;
}

void RegisterWatch::Read(std::uint32_t address, std::uint32_t word) {
    if (address == plugin::kIdentificationRegister && !identification_) identification_ = word;
    if (address != plugin::kFlashCommandRegister || !committing_) return;
    if ((word & plugin::kCommitBit) != 0) return;
    work_.registers[*committing_].commit = Commit::Done;
    committing_.reset();
}

std::string UnendedCommit(const UserRegisterWork& work) {
    for (unsigned index = 0; index < work.registers.size(); ++index)
        if (work.registers.at(index).commit == Commit::Begun)
            return fmt::format("the commit of user register {} hasn't ended", index);
    return "";
}

std::string Describe(const UserRegisterWork& work, const RegisterValues& values) {
    const auto untouched = [](const UserRegister& one) { return !one.written; };
    if (std::ranges::all_of(work.registers, untouched))
        return "the user registers are as they were";
    std::string text;
    for (unsigned index = 0; index < values.size(); ++index) {
        const auto [written, commit] = work.registers.at(index);
        text += fmt::format("{}user register {} ", index == 0 ? "" : ", ", index);
        if (values[index])
            text += fmt::format("holds {:#010x}", *values[index]);
        else
            text += written ? "may have changed and can't be read" : "is as it was";
        if (!written) continue;
        text += commit == Commit::Done    ? " (committed)"
                : commit == Commit::Begun ? " (perhaps committed)"
                                          : " (not committed)";
    }
    return text;
}

Json ToJson(const UserRegisterWork& work, const RegisterValues& values) {
    Json registers = Json::array();
    for (unsigned index = 0; index < values.size(); ++index) {
        const Commit commit = work.registers.at(index).commit;
        registers.push_back(
            {{"register", index},
             {"value", values[index] ? Json(*values[index]) : Json(nullptr)},
             {"committed",
              commit == Commit::Begun ? Json(nullptr) : Json(commit == Commit::Done)}});
    }
    return registers;
}

}  // namespace host
