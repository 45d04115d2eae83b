// What a process is told by its surroundings.

#pragma once

#include <optional>
#include <string>
#include <vector>

namespace base {

/// The words behind the program's name; given what main was given.
std::vector<std::string> ArgumentWords(int argc, char** argv);

std::optional<std::string> EnvironmentVariable(const std::string& name);

/// All variables, as "NAME=TEXT".
std::vector<std::string> EnvironmentVariables();

/// Where this user's programs keep their settings, each in a directory of its own; empty when
/// nothing tells.
std::string ConfigurationDirectory();

/// The variables that tell it, for a user who has set none: "neither ONE nor OTHER is set".
extern const char* const kNoConfigurationDirectory;

/// The directory that the running program lies in, with a slash at its end.
std::string ExecutableDirectory();

}  // namespace base
