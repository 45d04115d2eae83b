// The environment, the rules of the XDG base directories, and /proc.

#include "base/system/Environment.h"

#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <system_error>

namespace base {

std::vector<std::string> ArgumentWords(int argc, char** argv) {
    return {argv + 1, argv + argc};
}

std::optional<std::string> EnvironmentVariable(const std::string& name) {
    const char* text = std::getenv(name.c_str());
    return text == nullptr ? std::nullopt : std::optional<std::string>(text);
}

std::vector<std::string> EnvironmentVariables() {
    std::vector<std::string> variables;
    for (char** variable = environ; *variable != nullptr; ++variable)
        variables.emplace_back(*variable);
    return variables;
}

std::string ConfigurationDirectory() {
    // Only an absolute path counts.
    std::string xdg = EnvironmentVariable("XDG_CONFIG_HOME").value_or("");
    if (xdg.starts_with('/')) return xdg;
    const std::string home = EnvironmentVariable("HOME").value_or("");
    return home.empty() ? "" : home + "/.config";
}

const char* const kNoConfigurationDirectory = "neither XDG_CONFIG_HOME nor HOME is set";

std::string ExecutableDirectory() {
    std::error_code error;
    const auto self = std::filesystem::read_symlink("/proc/self/exe", error);
    return error ? "./" : self.parent_path().string() + "/";
}

}  // namespace base
