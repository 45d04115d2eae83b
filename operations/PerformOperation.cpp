// The operations that a user can choose by name.

#include <algorithm>
#include <array>
#include <stdexcept>
#include <string_view>

#include "device/FlashCorvane.h"
#include "operations/NamedOperation.h"
#include "plugin/Trace.h"

namespace {

constexpr bool kUnlisted = false;  // for those who bring up a new host

// Joined by the compiler: hosts keep the pointer for as long as the library is loaded.
template <typename Operations>
consteval auto JoinListed(const Operations& operations) {
    std::array<char, 256> text{};
    std::size_t end = 0;
    for (const auto& operation : operations) {
        if (!operation.listed) continue;
        for (const char* part : {end == 0 ? "" : " | ", operation.name}) {
            for (; *part != '\0'; ++part)
                text.at(end++) = *part;
        }
    }
    return text;
}

}  // namespace

struct FlashCorvane::Operations {
    using enum RegisterAccess;
    using enum RegisterChoice;

    static constexpr auto oneStep = &FlashCorvane::RunOneStep;
    static constexpr auto onUserRegisters = &FlashCorvane::RunUserRegisterOperation;
    static constexpr NamedOperation table[] = {
        {"Erase", &FlashCorvane::RunErase, "Erasing device...", "Error erasing flash.",
         &FlashCorvane::Erase},
        {"BlankCheck", oneStep, "Performing Blank Check...", "Error performing Blank Check.",
         &FlashCorvane::BlankCheck},
        {"CalculateChecksum", oneStep, "Calculating CRC-32...", "Error calculating CRC.",
         &FlashCorvane::CalculateChecksum},
        {"ProgramUserRegister0", onUserRegisters, {}, {}, {}, Program, Register0},
        {"ReadUserRegister0", onUserRegisters, {}, {}, {}, Read, Register0},
        {"ProgramUserRegister1", onUserRegisters, {}, {}, {}, Program, Register1},
        {"ReadUserRegister1", onUserRegisters, {}, {}, {}, Read, Register1},
        {"ProgramMACAddress", onUserRegisters, {}, {}, {}, Program, MACAddress},
        {"ReadMACAddress", onUserRegisters, {}, {}, {}, Read, MACAddress},
        {"Test", &FlashCorvane::RunTest, {}, {}, {}, {}, {}, kUnlisted},
    };
};

const char* FlashCorvane::ListSupportedOperations() const {
    TRACE(Entry, "FlashCorvane::ListSupportedOperations()");
    static constexpr auto text = JoinListed(Operations::table);
    return text.data();
}

// Runtime errors are shown to the user. Whatever else leaves an operation is the host's to handle.
bool FlashCorvane::PerformOperation(const char* operationName) {
    const std::string name = operationName == nullptr ? "" : operationName;
    TRACE(Entry, "FlashCorvane::PerformOperation(%s)", name.c_str());
    try {
        RunOperation(name);
    } catch (const std::runtime_error& error) {
        const std::string text = error.what();
        p_mHost.ShowErrorText(text.empty() ? "Unknown exception" : text);
        TRACE(Result, "FlashCorvane::PerformOperation() = false");
        return false;
    }
    TRACE(Result, "FlashCorvane::PerformOperation() = true");
    return true;
}

void FlashCorvane::RunOperation(std::string_view operationName) {
    const auto operation = std::ranges::find_if(
        Operations::table, [&](const auto& row) { return row.name == operationName; });
    if (operation == std::end(Operations::table)) {
        throw std::runtime_error("Flash Programmer: Unsupported Operation Code.");
    }
    (this->*operation->run)(*operation);
}

// The error texts end in a full stop, and users know the message with the second one.
template <typename Step>
void FlashCorvane::RunOperationStep(const std::string& statusText, const std::string& errorText,
                                    Step step) {
    p_mHost.ShowMessageText(statusText);
    if (!step()) throw std::runtime_error("Flash Programmer: " + errorText + ".");
    p_mHost.ShowMessageText("Operation completed successfully.");
}

void FlashCorvane::RunOneStep(const NamedOperation& operation) {
    RunOperationStep(operation.statusText, operation.errorText,
                     [&] { return (this->*operation.step)(); });
}

void FlashCorvane::RunErase(const NamedOperation& operation) {
    RunOperationStep("Initializing device...", "Error initializing device.",
                     [this] { return InitializeDevice(); });
    ResetSettings(0);
    RunOneStep(operation);
}

void FlashCorvane::RunUserRegisterOperation(const NamedOperation& operation) {
    RunOperationStep("User Register operation...", "Error accessing User Register operation.",
                     [&] { return UserRegisterOperation(operation); });
}

void FlashCorvane::RunTest(const NamedOperation&) {
    p_mHost.WriteHalfword(0x20000000, 0x1234);
}
