// Reading texts through pointers that a host handed over without trusting them: what can't be read
// is found out instead of ending the process.

#pragma once

#include <optional>
#include <string>

namespace hostcheck {

/// The text at `text`, which isn't null. Nothing when it can't be read or has no end within 64 KiB.
std::optional<std::string> ReadableText(const char* text);

}  // namespace hostcheck
