// Errors of the system are numbers of <cerrno>, on each system the same, and have texts.

#pragma once

#include <string>

namespace base {

/// "No such file or directory".
std::string ErrorText(int error);

}  // namespace base
