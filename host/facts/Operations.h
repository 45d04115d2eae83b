// What a host knows of the plug-in's operations: their names and the texts around them.
// docs/host-guide.md explains it.

#pragma once

#include <algorithm>
#include <string>
#include <string_view>
#include <vector>

namespace host::plugin {

// The operations, by the names that Initialize lists.
inline constexpr char kErase[] = "Erase";
inline constexpr char kBlankCheck[] = "BlankCheck";
inline constexpr char kCalculateChecksum[] = "CalculateChecksum";
inline constexpr char kReadMac[] = "ReadMACAddress";
inline constexpr char kProgramMac[] = "ProgramMACAddress";

inline std::string ReadRegisterOperation(unsigned index) {
    return "ReadUserRegister" + std::to_string(index);
}

inline std::string ProgramRegisterOperation(unsigned index) {
    return "ProgramUserRegister" + std::to_string(index);
}

/// All of them, in the plug-in's order.
inline constexpr const char* kOperations[] = {
    kErase,
    kBlankCheck,
    kCalculateChecksum,
    "ProgramUserRegister0",
    "ReadUserRegister0",
    "ProgramUserRegister1",
    "ReadUserRegister1",
    kProgramMac,
    kReadMac,
};

/// What stands between the names in the list of operations.
inline constexpr std::string_view kOperationSeparator = " | ";

inline std::vector<std::string> OperationNames(const std::string& joined) {
    std::vector<std::string> names;
    for (std::size_t start = 0; start <= joined.size();) {
        const std::size_t end = std::min(joined.find(kOperationSeparator, start), joined.size());
        names.push_back(joined.substr(start, end - start));
        start = end + kOperationSeparator.size();
    }
    return names;
}

/// What ends a step of an operation: the whole text, and the end of the other one.
inline constexpr char kStepDone[] = "Operation completed successfully.";
inline constexpr char kStepFailed[] = "..";

/// The events at which a host resets the settings.
enum class ResetMode : int { LoadBegins = 0, TargetWillRun = 1, LoadComplete = 2 };

// The titles of the progress displays.
inline constexpr char kEraseTitle[] = "Erasing Flash.";
inline constexpr char kBlankCheckTitle[] = "Performing Blank Check";
inline constexpr char kChecksumTitle[] = "CRC Calculation";

}  // namespace host::plugin
