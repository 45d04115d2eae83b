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

void PublishUserRegister(const HostAccess& host, std::uint32_t index, std::uint32_t value) {
    const std::string text = ToHexText(value);
    host.SetSetting(Setting::FlashUserRegisterInput[index], text);
    host.ShowMessageText("User Register " + ToDecimalText(index) + " value: 0x" + text);
}

/// Returns whether it is to be committed.
bool ProgramUserRegister(const HostAccess& host, std::uint32_t index) {
    const std::uint32_t value = ParseHex(host.GetSetting(Setting::FlashUserRegisterInput[index]));
    host.WriteWord(kRegisterAddresses[index], value);
    host.ShowMessageText("Writing 0x" + ToHexText(value) + " to User Register " +
                         ToDecimalText(index));
    return ParseHex(host.GetSetting(Setting::FlashUserRegisterCommit[index])) == 1;
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
        PublishUserRegister(p_mHost, IndexOf(choice), values[IndexOf(choice)]);
    }
}

// All writes come before any commit, so that nothing is made permanent by an operation that could
// not write everything.
bool FlashCorvane::ProgramUserRegisters(RegisterChoice choice) {
    CommitRequests requests{};
    if (choice != RegisterChoice::MACAddress) {
        requests[IndexOf(choice)] = ProgramUserRegister(p_mHost, IndexOf(choice));
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
