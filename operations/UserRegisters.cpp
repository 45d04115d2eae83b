// The two user registers, volatile until they are committed.

#include <chrono>
#include <exception>
#include <stdexcept>

#include "device/DeviceClass.h"
#include "device/FlashCorvane.h"
#include "device/RegisterMap.h"
#include "device/SettingKeys.h"
#include "plugin/Conversions.h"
#include "plugin/Trace.h"

namespace {

constexpr std::uint32_t kRegisterAddresses[] = {Register::UserRegister0, Register::UserRegister1};

// Selects a user register, and which one, instead of a flash sector.
constexpr std::uint32_t kCommitAddress = 0x80000000;
constexpr auto kCommitTimeLimit = std::chrono::seconds(5);

std::string Key(std::uint32_t index, const char* ending) {
    return Setting::FlashUserRegister + ToDecimalText(index) + ending;
}

bool IsReadOperation(const std::string& operationName) {
    return operationName == "ReadUserRegister0" || operationName == "ReadUserRegister1" ||
           operationName == "ReadMACAddress";
}

}  // namespace

bool FlashCorvane::UserRegisterOperation(const std::string& operationName) {
    TRACE(Entry, "FlashCorvane::UserRegisterOperation(%s)", operationName.c_str());
    if (p_mClassRev == DeviceClass::Ravik) {
        Host().ShowErrorText(
            "Flash Programmer: The current device does not have user reigsters. Operation "
            "Cancelled.");
        TRACE(Result, "FlashCorvane::UserRegisterOperation() = false");
        return false;
    }
    if (IsReadOperation(operationName)) {
        ReadUserRegisters(operationName);
    } else {
        try {
            if (!ProgramUserRegisters(operationName)) return false;
        } catch (const std::exception& error) {
            Host().ShowErrorText("Missing necessary option for User Register programming.");
            TRACE(Result, "FlashCorvane::UserRegisterOperation() = false %s", error.what());
            return false;
        }
    }
    TRACE(Result, "FlashCorvane::UserRegisterOperation() = true");
    return true;
}

// Both registers are read before one is published.
void FlashCorvane::ReadUserRegisters(const std::string& operationName) {
    const RegisterValues values = {Host().ReadWord(Register::UserRegister0),
                                   Host().ReadWord(Register::UserRegister1)};
    if (operationName == "ReadUserRegister0") {
        ReadUserRegister(0, values);
    } else if (operationName == "ReadUserRegister1") {
        ReadUserRegister(1, values);
    } else {
        ReadMACAddress(values);
    }
}

// All writes come before any commit, so that nothing is made permanent by an operation that could
// not write everything.
bool FlashCorvane::ProgramUserRegisters(const std::string& operationName) {
    CommitRequests requests{};
    if (operationName == "ProgramUserRegister0") {
        ProgramUserRegister(0, requests);
    } else if (operationName == "ProgramUserRegister1") {
        ProgramUserRegister(1, requests);
    } else if (operationName == "ProgramMACAddress") {
        if (!ProgramMACAddress(requests)) return false;
    }
    for (std::uint32_t index = 0; index < requests.size(); ++index) {
        if (!requests[index]) continue;
        Host().ShowMessageText("Programmed value committing to User Register " +
                               ToDecimalText(index));
        CommitUserRegister(index);
    }
    return true;
}

void FlashCorvane::ReadUserRegister(std::uint32_t index, const RegisterValues& values) {
    const std::string value = ToHexText(values[index]);
    Host().SetSetting(Key(index, Setting::Input), value);
    Host().ShowMessageText("User Register " + ToDecimalText(index) + " value: 0x" + value);
}

void FlashCorvane::ProgramUserRegister(std::uint32_t index, CommitRequests& requests) {
    const std::uint32_t value = ParseHex(Host().GetSetting(Key(index, Setting::Input)));
    Host().WriteWord(kRegisterAddresses[index], value);
    Host().ShowMessageText("Writing 0x" + ToHexText(value) + " to User Register " +
                           ToDecimalText(index));
    requests[index] = ParseHex(Host().GetSetting(Key(index, Setting::Commit))) == 1;
}

void FlashCorvane::CommitUserRegister(std::uint32_t index) {
    Host().WriteWord(Register::FlashAddress, kCommitAddress + index);
    Host().WriteWord(Register::FlashCommand, KeyedCommand(FlashCommand::CommitUserRegister));

    const auto deadline = std::chrono::steady_clock::now() + kCommitTimeLimit;
    while ((Host().ReadWord(Register::FlashCommand) & FlashCommand::CommitUserRegister) != 0) {
        if (std::chrono::steady_clock::now() >= deadline) {
            throw std::runtime_error("User Register commit timed out.");
        }
    }
    Host().ShowMessageText("Programmed value was committed to User Register " +
                           ToDecimalText(index));
}
