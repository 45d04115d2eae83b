// What a command would end with.

#pragma once

#include <fmt/format.h>

#include <string>

#include "host/base/Errors.h"

namespace test {

/// The text of the failure, with its status in front; empty when there was none.
template <typename Action>
std::string FailureOf(Action&& action) try {
    action();
    return "";
} catch (const host::Failure& failure) {
    return fmt::format("{}: {}", static_cast<int>(failure.Status()), failure.what());
}

}  // namespace test
