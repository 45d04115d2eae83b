// The words of an expectation are those of a simulated device.

#include "host/targets/ExpectedDevice.h"

#include <fmt/format.h>

#include <algorithm>

#include "host/base/Errors.h"
#include "host/base/Suggestion.h"
#include "host/base/Text.h"
#include "target/simulated/options/DeviceOptions.h"
#include "target/simulated/options/OptionValues.h"

namespace host {

namespace {

constexpr std::string_view kFlash = "flash=";

/// The names of the classes are ASCII.
std::string InLowerCase(std::string text) {
    std::transform(text.begin(), text.end(), text.begin(), [](char letter) {
        return letter >= 'A' && letter <= 'Z' ? static_cast<char>(letter - 'A' + 'a') : letter;
    });
    return text;
}

std::string Described(const std::string& family, std::uint64_t flashBytes) {
    return fmt::format("{} with {} of flash", family.empty() ? "no known class" : family,
                       SizeText(flashBytes));
}

}  // namespace

ExpectedDevice ParseExpectedDevice(const std::string& text) {
    const auto comma = text.find(',');
    ExpectedDevice expected{InLowerCase(text.substr(0, comma)), {}};
    const auto& names = target::DeviceClassNames();
    if (std::find(names.begin(), names.end(), expected.className) == names.end())
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("--expect: there is no device class '{}'{}",
                                  text.substr(0, comma), Suggestion(expected.className, names)));
    if (comma == std::string::npos) return expected;
    const std::string rest = text.substr(comma + 1);
    if (rest.starts_with(kFlash))
        expected.flashBytes = target::ParseSize(rest.substr(kFlash.size()));
    if (!expected.flashBytes)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("--expect: behind the class comes flash=SIZE, as in "
                                  "quen,flash=512K, not '{}'",
                                  rest));
    return expected;
}

void RequireExpected(const ExpectedDevice& expected, const std::string& family,
                     std::uint64_t flashBytes) {
    // Behind the class stands a revision: "Tolva Rev.B".
    const bool isClass = InLowerCase(family.substr(0, family.find(' '))) == expected.className;
    if (isClass && expected.flashBytes.value_or(flashBytes) == flashBytes) return;
    throw Failure(ExitStatus::Unreachable,
                  fmt::format("the device is {}, and {}{} is expected; nothing in it was changed",
                              Described(family, flashBytes), expected.className,
                              expected.flashBytes
                                  ? fmt::format(" with {} of flash", SizeText(*expected.flashBytes))
                                  : ""));
}

}  // namespace host
