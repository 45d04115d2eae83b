// What a device must be, as the user says it, before anything is done with it.

#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace host {

struct ExpectedDevice {
    std::string className;  ///< in lower case: "quen"
    std::optional<std::uint64_t> flashBytes;
};

/// "CLASS[,flash=SIZE]", for example "quen,flash=512K". Failure (WrongUsage) for any other text.
ExpectedDevice ParseExpectedDevice(const std::string& text);

/// Failure (Unreachable) when a device of this family ("Quen"; empty: an unknown one) with so much
/// flash is another one.
void RequireExpected(const ExpectedDevice& expected, const std::string& family,
                     std::uint64_t flashBytes);

}  // namespace host
