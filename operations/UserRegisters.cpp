// The two user registers, volatile until they are committed.

#include <chrono>
#include <exception>
#include <stdexcept>

#include "device/FlashCorvane.h"
#include "device/RegisterMap.h"
#include "device/SettingKeys.h"
#include "operations/NamedOperation.h"
#include "plugin/Conversions.h"
#include "plugin/Trace.h"

namespace {

constexpr std::uint32_t kRegisterAddresses[] = {Register::UserRegister0, Register::UserRegister1};

// Selects a user register, and which one, instead of a flash sector.
constexpr std::uint32_t kCommitAddress = 0x80000000;
constexpr auto kCommitTimeLimit = std::chrono::seconds(5);

std::uint32_t IndexOf(RegisterChoice choice) {
    return static_cast<std::uint32_t>(choice);
}

}  // namespace

bool FlashCorvane::UserRegisterOperation(const NamedOperation& operation) {
    TRACE(Entry, "FlashCorvane::UserRegisterOperation(%s)", operation.name);
    if (p_mClassRev == DeviceClass::Ravik) {
        p_mHost.ShowErrorText(
            "Flash Programmer: The current device does not have user reigsters. Operation "
            "Cancelled.");
        TRACE(Result, "FlashCorvane::UserRegisterOperation() = false");
        return false;
    }
    if (operation.access == RegisterAccess::Read) {
        ReadUserRegisters(operation.choice);
    } else {
        try {
            if (!ProgramUserRegisters(operation.choice)) return false;
        } catch (const std::exception& error) {
            p_mHost.ShowErrorText("Missing necessary option for User Register programming.");
            TRACE(Result, "FlashCorvane::UserRegisterOperation() = false %s", error.what());
            return false;
        }
    }
    TRACE(Result, "FlashCorvane::UserRegisterOperation() = true");
    return true;
}

// Both registers are read before one is published.
void FlashCorvane::ReadUserRegisters(RegisterChoice choice) {
    const RegisterValues values = {p_mHost.ReadWord(Register::UserRegister0),
                                   p_mHost.ReadWord(Register::UserRegister1)};
    if (choice == RegisterChoice::MACAddress) {
        ReadMACAddress(values);
    } else {
        ReadUserRegister(IndexOf(choice), values);
    }
}

// All writes come before any commit, so that nothing is made permanent by an operation that could
// not write everything.
bool FlashCorvane::ProgramUserRegisters(RegisterChoice choice) {
    CommitRequests requests{};
    if (choice != RegisterChoice::MACAddress) {
        ProgramUserRegister(IndexOf(choice), requests);
    } else if (!ProgramMACAddress(requests)) {
        return false;
    }
    for (std::uint32_t index = 0; index < requests.size(); ++index) {
        if (!requests[index]) continue;
        p_mHost.ShowMessageText("Programmed value committing to User Register " +
                                ToDecimalText(index));
        CommitUserRegister(index);
    }
    return true;
}

void FlashCorvane::ReadUserRegister(std::uint32_t index, const RegisterValues& values) {
    const std::string value = ToHexText(values[index]);
    p_mHost.SetSetting(Setting::FlashUserRegisterInput[index], value);
    p_mHost.ShowMessageText("User Register " + ToDecimalText(index) + " value: 0x" + value);
}

void FlashCorvane::ProgramUserRegister(std::uint32_t index, CommitRequests& requests) {
    const std::uint32_t value =
        ParseHex(p_mHost.GetSetting(Setting::FlashUserRegisterInput[index]));
    p_mHost.WriteWord(kRegisterAddresses[index], value);
    p_mHost.ShowMessageText("Writing 0x" + ToHexText(value) + " to User Register " +
                            ToDecimalText(index));
    requests[index] = ParseHex(p_mHost.GetSetting(Setting::FlashUserRegisterCommit[index])) == 1;
}

void FlashCorvane::CommitUserRegister(std::uint32_t index) {
    p_mHost.WriteWord(Register::FlashAddress, kCommitAddress + index);
    p_mHost.WriteWord(Register::FlashCommand, KeyedCommand(FlashCommandBit::CommitUserRegister));

    const auto deadline = std::chrono::steady_clock::now() + kCommitTimeLimit;
    while ((p_mHost.ReadWord(Register::FlashCommand) & FlashCommandBit::CommitUserRegister) != 0) {
        if (std::chrono::steady_clock::now() >= deadline) {
            throw std::runtime_error("User Register commit timed out.");
        }
    }
    p_mHost.ShowMessageText("Programmed value was committed to User Register " +
                            ToDecimalText(index));
}
