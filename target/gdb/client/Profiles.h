// Profiles: how GDB servers differ where the protocol leaves it to them, or where they don't keep
// to it. One row for each server; an option of the user's stands above it.

#pragma once

#include <span>
#include <string_view>

namespace target::gdb {

struct Profile {
    const char* name;  ///< as server=NAME says it

    /// What its answer to "monitor version" holds; null when that doesn't tell.
    const char* saysVersion;

    const char* reset;     ///< as the option reset takes it
    bool trueX;            ///< "X" is answered when it is done, not before
    bool triesLive;        ///< whether a read of the running target is worth a try
    bool detachResumes;    ///< "D" lets the target run, as the protocol has it
    bool trusted = false;  ///< what it says of reads and halts needn't be tried; it is ours
    const char* reads;     ///< what makes it report reads that failed; null: it does so

    // For docs/boards.md.
    const char* title;
    const char* start;    ///< the command that starts it
    const char* options;  ///< of corvane-flash
    const char* tried;
};

/// The first row holds for a server that isn't known.
std::span<const Profile> Profiles();

/// Null for a name that no profile has.
const Profile* FindProfile(std::string_view name);

/// The profile of the server that answers so to "monitor version"; the first row when none does.
const Profile& ProfileOf(std::string_view version);

}  // namespace target::gdb
