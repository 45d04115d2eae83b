// Reading through pointers that a host handed over without trusting them: what can't be read is
// found out instead of ending the process.

#pragma once

#include <cstddef>
#include <optional>
#include <string>

namespace hostcheck {

/// Copies bytes of this process. False when some of them can't be read.
bool CopyReadable(void* to, const void* from, std::size_t bytes);

/// The text at `text`, which isn't null. Nothing when it can't be read or has no end within 64 KiB.
std::optional<std::string> ReadableText(const char* text);

}  // namespace hostcheck
