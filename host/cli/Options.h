// What the command line said, as a plain value. Texts stay texts: the command that uses one reads
// it, and says what is wrong with it.

#pragma once

#include <optional>
#include <string>
#include <vector>

namespace host {

struct Options {
    std::string command;  ///< "program", "mac read"

    // Every command.
    std::optional<std::string> sim;
    std::optional<std::string> simFile;
    std::optional<std::string> gdb;
    std::vector<std::string> gdbOptions;
    std::optional<std::string> loader;
    std::optional<std::string> settingsFile;
    std::optional<std::string> plugin;
    std::optional<std::string> trace;
    std::vector<std::string> set;
    std::string progress = "auto";
    bool json = false;
    bool quiet = false;
    int verbose = 0;

    std::vector<std::string> targetVariables;  ///< environment variables that name a target

    // Some commands.
    std::vector<std::string> files;
    std::vector<std::string> words;  ///< that the help is about, or to complete
    std::optional<std::string> format;
    std::optional<std::string> base;
    std::optional<std::string> range;
    std::optional<std::string> erase;
    std::optional<std::string> imageOf;
    std::optional<std::string> argument;  ///< operation, setting, MAC address, shell
    std::optional<std::string> index;     ///< of a user register
    std::optional<std::string> value;     ///< for a user register
    std::optional<std::string> forget;
    bool all = false;
    bool blankCheck = false;
    bool commit = false;
    bool crc = false;
    bool dryRun = false;
    bool force = false;
    bool keep = false;
    bool noVerify = false;
    bool rewrite = false;
    bool run = false;
};

}  // namespace host
