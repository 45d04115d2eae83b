// The operations that a user can choose by name.

#include <algorithm>
#include <stdexcept>
#include <string_view>

#include "device/FlashCorvane.h"
#include "plugin/ErrorText.h"
#include "plugin/Trace.h"

struct FlashCorvane::NamedOperation {
    std::string_view name;
    void (FlashCorvane::*run)(const std::string& operationName);
};

const char* FlashCorvane::ListSupportedOperations() const {
    TRACE(Entry, "FlashCorvane::ListSupportedOperations()");
    return "Erase | BlankCheck | CalculateChecksum | ProgramUserRegister0 | ReadUserRegister0 | "
           "ProgramUserRegister1 | ReadUserRegister1 | ProgramMACAddress | ReadMACAddress";
}

// Runtime errors are shown to the user. Whatever else leaves an operation is the host's to handle.
bool FlashCorvane::PerformOperation(const char* operationName) {
    const std::string name = operationName == nullptr ? "" : operationName;
    TRACE(Entry, "FlashCorvane::PerformOperation(%s)", name.c_str());
    try {
        RunOperation(name);
    } catch (const std::runtime_error& error) {
        const std::string text = error.what();
        Host().ShowErrorText(text.empty() ? "Unknown exception" : text);
        TRACE(Result, "FlashCorvane::PerformOperation() = false");
        return false;
    }
    TRACE(Result, "FlashCorvane::PerformOperation() = true");
    return true;
}

void FlashCorvane::RunOperation(const std::string& operationName) {
    static constexpr NamedOperation operations[] = {
        {"Erase", &FlashCorvane::RunErase},
        {"BlankCheck", &FlashCorvane::RunBlankCheck},
        {"CalculateChecksum", &FlashCorvane::RunCalculateChecksum},
        {"ProgramUserRegister0", &FlashCorvane::RunUserRegisterOperation},
        {"ProgramUserRegister1", &FlashCorvane::RunUserRegisterOperation},
        {"ReadUserRegister0", &FlashCorvane::RunUserRegisterOperation},
        {"ReadUserRegister1", &FlashCorvane::RunUserRegisterOperation},
        {"ProgramMACAddress", &FlashCorvane::RunUserRegisterOperation},
        {"ReadMACAddress", &FlashCorvane::RunUserRegisterOperation},
        {"Test", &FlashCorvane::RunTest},  // not listed: for those who bring up a new host
    };
    const auto operation = std::ranges::find(operations, operationName, &NamedOperation::name);
    if (operation == std::end(operations)) {
        throw std::runtime_error("Flash Programmer: Unsupported Operation Code.");
    }
    (this->*operation->run)(operationName);
}

// The error texts end in a full stop, and users know the message with the second one.
void FlashCorvane::RunOperationStep(const std::string& statusText, const std::string& errorText,
                                    const std::function<bool()>& step) {
    Host().ShowMessageText(statusText);
    if (!step()) throw std::runtime_error("Flash Programmer: " + errorText + ".");
    Host().ShowMessageText("Operation completed successfully.");
}

void FlashCorvane::RunErase(const std::string&) {
    RunOperationStep("Initializing device...", "Error initializing device.",
                     [this] { return InitializeDevice(); });
    ResetSettings(0);
    RunOperationStep("Erasing device...", "Error erasing flash.", [this] { return Erase(); });
}

void FlashCorvane::RunBlankCheck(const std::string&) {
    RunOperationStep("Performing Blank Check...", "Error performing Blank Check.",
                     [this] { return BlankCheck(); });
}

void FlashCorvane::RunCalculateChecksum(const std::string&) {
    RunOperationStep("Calculating CRC-32...", "Error calculating CRC.",
                     [this] { return CalculateChecksum(); });
}

void FlashCorvane::RunUserRegisterOperation(const std::string& operationName) {
    RunOperationStep("User Register operation...", "Error accessing User Register operation.",
                     [this, operationName] { return UserRegisterOperation(operationName); });
}

void FlashCorvane::RunTest(const std::string&) {
    const std::uint16_t pattern = 0x1234;
    ThrowOnError(p_mHost->WriteMemory(&pattern, 1, 0x20000000, 1, sizeof pattern));
}
