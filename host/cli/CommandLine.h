// From a followed command line to plain values, or to a complaint.

#pragma once

#include <functional>
#include <optional>
#include <string>

#include "base/system/Environment.h"
#include "host/cli/CommonOptions.h"
#include "host/cli/FollowedLine.h"
#include "host/settings/ProjectFile.h"
#include "host/settings/SettingStore.h"

namespace host {

struct ParsedLine {
    const CommandRow* command = nullptr;  ///< null: `answer` is all that was asked for
    GivenOptions given;                   ///< the weakest first: the last one of a name counts
    CommonOptions common;                 ///< the values of those that every command takes
    ProjectSettings project;              ///< what the project file sets for this run
    std::string answer;                   ///< help, version or man page
};

/// A variable's text; nothing when it isn't set.
using ReadVariable = std::function<std::optional<std::string>(const char* name)>;

using ReadProject = std::function<ProjectFile()>;

/// Failure (WrongUsage) for a line that makes no sense, and what `project` throws. Commands that
/// work on no target don't ask for the project.
ParsedLine ParseCommandLine(const CommandRows& commands, const FollowedLine& line,
                            const ReadVariable& environment = base::EnvironmentVariable,
                            const ReadProject& project = ReadNearestProject);

}  // namespace host
