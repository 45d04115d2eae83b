// The scripts that let a shell complete the tool's command lines. Each asks the tool, with
// 'completion words', and fits the answer to its shell.

#pragma once

#include <span>
#include <string>

namespace host {

struct CompletionScript {
    const char* shell;
    const char* text;
};

std::span<const CompletionScript> CompletionScripts();

/// What 'completion words' says instead of a word where files may stand, before a tab and what
/// comes before their names.
inline constexpr char kFilesMark[] = ":files";

}  // namespace host
