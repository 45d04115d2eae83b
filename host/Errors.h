// The exit statuses of corvane-flash, which are an interface, and the exception that carries one.

#pragma once

#include <stdexcept>
#include <string>

namespace host {

enum class ExitStatus {
    Done = 0,
    DeviceFailed = 1,    ///< the device or the plug-in reported a failure
    WrongUsage = 2,      ///< wrong command line
    BadFile = 3,         ///< an image or settings file is missing, unreadable or wrong
    Unreachable = 4,     ///< the plug-in or the target can't be loaded or reached
    ContentsDiffer = 5,  ///< the flash differs from what was expected, or isn't blank
    Interrupted = 130,
};

/// A failure that ends a command: one line for the user, which names the thing and says what to
/// try, and the status to exit with.
class Failure : public std::runtime_error {
  public:
    Failure(ExitStatus status, const std::string& text)
        : std::runtime_error(text), status_(status) {}

    ExitStatus Status() const { return status_; }

  private:
    ExitStatus status_;
};

}  // namespace host
