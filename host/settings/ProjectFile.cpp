// What may stand in a project file is a table: each key is an option of the command line, or one of
// those behind --gdb-option.

#include "host/settings/ProjectFile.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <filesystem>
#include <string_view>

#include "base/system/Paths.h"
#include "host/base/Errors.h"
#include "host/base/Suggestion.h"
#include "host/files/InputFile.h"
#include "host/settings/SettingTable.h"

namespace host {

namespace {

namespace fs = std::filesystem;

constexpr FileKind kProjectFile{"project file", ExitStatus::BadFile, std::uint64_t{1} << 20};

enum class Key { Option, File, GdbOption, Refused };

struct KeyRow {
    const char* name;
    Key key;
};

constexpr KeyRow kKeys[] = {
    {"gdb", Key::Option},        {"sim", Key::Option},        {"expect", Key::Option},
    {"wait", Key::Option},       {"loader", Key::File},       {"server", Key::GdbOption},
    {"attach", Key::GdbOption},  {"writes", Key::GdbOption},  {"reads", Key::GdbOption},
    {"live", Key::GdbOption},    {"pc", Key::GdbOption},      {"sp", Key::GdbOption},
    {"ram-end", Key::GdbOption}, {"timeout", Key::GdbOption}, {"detach", Key::GdbOption},
    {"plugin", Key::Refused},    {"sim-file", Key::Refused},  {"trace", Key::Refused},
    {"init", Key::Refused},      {"reset", Key::Refused},     {"gdb-option", Key::Refused},
};

std::vector<std::string> KnownKeys() {
    std::vector<std::string> names{"settings"};
    for (const KeyRow& row : kKeys)
        if (row.key != Key::Refused) names.emplace_back(row.name);
    return names;
}

std::string RequireTextOf(const toml::node& node, std::string_view key) {
    if (const auto* text = node.as_string()) return text->get();
    if (const auto* number = node.as_integer()) return std::to_string(number->get());
    throw TableError(node, fmt::format("{} must be a text between quotes", key));
}

const toml::table& RequireTable(const toml::node& node, std::string_view name) {
    if (const toml::table* table = node.as_table()) return *table;
    throw TableError(node, fmt::format("{0} is a table; write [{0}] above its keys", name));
}

void AddKey(Board& board, const std::string& folder, const std::string& key,
            const toml::node& node) {
    const auto row = std::find_if(std::begin(kKeys), std::end(kKeys),
                                  [&](const KeyRow& one) { return key == one.name; });
    if (row == std::end(kKeys))
        throw TableError(node,
                         fmt::format("a board has no {}{}", key, Suggestion(key, KnownKeys())));
    if (row->key == Key::Refused)
        throw TableError(node,
                         fmt::format("{} can't stand in a project file, for it would be run or "
                                     "written wherever that file comes from; give it in the "
                                     "command line",
                                     key));
    const std::string text = RequireTextOf(node, key);
    if (text.empty()) throw TableError(node, fmt::format("{} is empty; leave it out", key));
    // A comma begins the next option, which may be one that is refused here.
    if (row->key == Key::GdbOption && text.find(',') != std::string::npos)
        throw TableError(node, fmt::format("{} takes one value, without a comma", key));
    if (row->key == Key::GdbOption)
        board.options.emplace_back("--gdb-option", fmt::format("{}={}", key, text));
    else if (row->key == Key::File)
        board.options.emplace_back("--" + key,
                                   base::NameOf(base::PathOf(folder) / base::PathOf(text)));
    else
        board.options.emplace_back("--" + key, text);
}

Board BoardOf(const toml::table& table, const ProjectFile& project, const std::string& folder) {
    Board board{{}, project.settings};
    for (const auto& [key, node] : table) {
        if (key.str() != "settings") {
            AddKey(board, folder, std::string(key.str()), node);
            continue;
        }
        for (const auto& [name, text] : SettingsOf(RequireTable(node, "settings"), false))
            board.settings[name] = text;
    }
    return board;
}

void AddBoards(ProjectFile& project, const toml::node& node) {
    const std::string folder = base::NameOf(base::PathOf(project.path).parent_path());
    for (const auto& [name, board] : RequireTable(node, "board.NAME"))
        project.boards.emplace(
            name.str(),
            BoardOf(RequireTable(board, fmt::format("board.{}", name.str())), project, folder));
}

/// Settings come before the boards that stand on them.
ProjectFile ProjectOf(const toml::table& table, const std::string& path) {
    ProjectFile project{path, {}, {}, {}};
    for (const auto& [key, node] : table)
        if (key.str() != "settings" && key.str() != "board" && key.str() != "default")
            throw TableError(node,
                             fmt::format("there is no {}; a project file has default = \"NAME\", "
                                         "[settings] and [board.NAME]",
                                         key.str()));
    if (const toml::node* settings = table.get("settings"))
        project.settings = SettingsOf(RequireTable(*settings, "settings"), false);
    if (const toml::node* boards = table.get("board")) AddBoards(project, *boards);
    const toml::node* name = table.get("default");
    if (name == nullptr) return project;
    project.defaultBoard = RequireTextOf(*name, "default");
    if (!project.boards.contains(project.defaultBoard))
        throw TableError(*name, fmt::format("there is no [board.{}]", project.defaultBoard));
    return project;
}

}  // namespace

const Board& ProjectFile::RequireBoard(const std::string& name) const {
    if (const auto found = boards.find(name); found != boards.end()) return found->second;
    if (path.empty())
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("--board {}: there is no {} in this folder or above it", name,
                                  kProjectFileName));
    std::vector<std::string> names;
    for (const auto& [known, board] : boards)
        names.push_back(known);
    throw Failure(ExitStatus::WrongUsage,
                  fmt::format("--board: {} has no board '{}'; it has {}", path, name,
                              names.empty() ? "none" : fmt::format("{}", fmt::join(names, ", "))));
}

ProjectFile ReadProjectFile(const std::string& path) {
    const auto refuse = [&](std::uint32_t line, std::string_view why) {
        return Failure(ExitStatus::BadFile,
                       fmt::format("project file {}: line {}: {}", path, line, why));
    };
    try {
        return ProjectOf(toml::parse(ReadWholeFile(kProjectFile, path), path), path);
    } catch (const TableError& error) {
        throw refuse(error.line, error.what());
    } catch (const toml::parse_error& error) {
        throw refuse(error.source().begin.line, error.description());
    }
}

ProjectFile ReadNearestProject() {
    std::error_code error;
    for (fs::path folder = fs::current_path(error); !error; folder = folder.parent_path()) {
        const fs::path file = folder / kProjectFileName;
        std::error_code ignored;
        if (fs::exists(file, ignored)) return ReadProjectFile(base::NameOf(file));
        if (folder == folder.parent_path()) break;
    }
    return {};
}

}  // namespace host
