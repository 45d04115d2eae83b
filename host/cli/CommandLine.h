// From a followed command line to plain values, or to a complaint.

#pragma once

#include <functional>
#include <string>

#include "host/cli/CommonOptions.h"
#include "host/cli/FollowedLine.h"

namespace host {

struct ParsedLine {
    const CommandRow* command = nullptr;  ///< null: `answer` is all that was asked for
    GivenOptions given;                   ///< the line's, then what the environment adds
    CommonOptions common;                 ///< the values of those that every command takes
    std::string answer;                   ///< help, version or man page
};

/// A variable's text; empty when it isn't set.
using ReadVariable = std::function<std::string(const char* name)>;
std::string ProcessEnvironment(const char* name);

/// Failure (WrongUsage) for a line that makes no sense.
ParsedLine ParseCommandLine(const CommandRows& commands, const FollowedLine& line,
                            const ReadVariable& environment = ProcessEnvironment);

}  // namespace host
