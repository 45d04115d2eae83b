// Windows speaks UTF-16, the program UTF-8; and Windows has numbers of its own for errors.

#pragma once

#include <string>
#include <string_view>

namespace base {

std::wstring Utf16(std::string_view text);
std::string Utf8(std::wstring_view text);

/// A path as the system takes it at any length.
std::wstring SystemPath(const std::string& path);

/// The number of <cerrno> for one of GetLastError's.
int ErrorNumber(unsigned long error);

/// Sets errno after a failed call.
void SetErrno();

}  // namespace base
