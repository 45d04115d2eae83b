// The exit statuses of corvane-flash, which are an interface, and the exception that carries one.

#pragma once

#include <stdexcept>
#include <string>

namespace host {

enum class ExitStatus {
    Done = 0,
    DeviceFailed = 1,
    WrongUsage = 2,
    BadFile = 3,
    Unreachable = 4,
    ContentsDiffer = 5,
    InternalError = 70,
    Interrupted = 130,
};

/// What each status means, as the help and the man page tell it.
inline constexpr struct {
    ExitStatus status;
    const char* meaning;
} kExitStatuses[] = {
    {ExitStatus::Done, "done"},
    {ExitStatus::DeviceFailed, "the device or the plug-in reported a failure"},
    {ExitStatus::WrongUsage, "the command line is wrong"},
    {ExitStatus::BadFile, "a file is missing, unreadable or wrong, or can't be written"},
    {ExitStatus::Unreachable, "the plug-in or the target can't be loaded or reached"},
    {ExitStatus::ContentsDiffer, "the flash differs from what was expected, or isn't blank"},
    {ExitStatus::InternalError, "an error of the tool itself, to be reported to its makers"},
    {ExitStatus::Interrupted, "interrupted"},
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
