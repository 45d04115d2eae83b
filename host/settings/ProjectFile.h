// The project file, corvane-flash.toml: the boards of a project by name, and settings for all who
// work on it.
//
//     default = "bench"            # for whoever names no target
//
//     [settings]
//     FlashCrystalFreq = "10"
//
//     [board.bench]
//     gdb = ":3333"
//     server = "openocd"
//     loader = "boot/FlashLoaderMerrow.out"
//     expect = "quen,flash=512K"
//
// It may come with somebody else's files. So nothing can stand in it that is run on this machine or
// on the probe's, and no file that is written.

#pragma once

#include <map>
#include <string>
#include <utility>
#include <vector>

#include "host/settings/SettingFiles.h"

namespace host {

struct Board {
    /// Options of the command line, by their long names, and their texts, in the file's order.
    std::vector<std::pair<std::string, std::string>> options;
    SettingTexts settings;  ///< the project's, and above them the board's own
};

struct ProjectFile {
    std::string path;          ///< empty: there is none
    std::string defaultBoard;  ///< empty: none
    SettingTexts settings;
    std::map<std::string, Board> boards;

    /// Failure (WrongUsage) for a name that isn't there, with those that are.
    const Board& RequireBoard(const std::string& name) const;
};

inline constexpr char kProjectFileName[] = "corvane-flash.toml";

/// Reads the file of that name in the working folder or, if there is none, in the nearest one
/// above. Failure (BadFile) names the file, the line and what to do.
ProjectFile ReadNearestProject();

/// The same of one file, whose relative names are taken from its own folder.
ProjectFile ReadProjectFile(const std::string& path);

}  // namespace host
