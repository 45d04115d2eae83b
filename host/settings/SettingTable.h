// Settings as a table of a TOML file, whatever file that is.

#pragma once

#include <toml++/toml.h>

#include <cstdint>
#include <stdexcept>
#include <string>

#include "host/settings/SettingFiles.h"

namespace host {

/// What is wrong in a line of such a file, and what to do.
struct TableError : std::runtime_error {
    TableError(const toml::node& node, const std::string& text)
        : std::runtime_error(text), line(node.source().begin.line) {}

    std::uint32_t line;
};

/// The texts of a table in the form that the plug-in takes. One that the tool has `kept` may hold
/// what only the plug-in writes. TableError.
SettingTexts SettingsOf(const toml::table& table, bool kept);

}  // namespace host
