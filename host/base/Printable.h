// Texts from outside (names of files, arguments, what a server says) in a form that no terminal
// takes for commands.

#pragma once

#include <string>
#include <string_view>

namespace host {

/// What becomes of line breaks: a text of one line has none of its own.
enum class Breaks { Escape, Keep };

/// The text with control characters and what isn't UTF-8 as "\x1b", "\u0085" or "\n". Tabs stay.
std::string Printable(std::string_view text, Breaks breaks = Breaks::Escape);

/// JSON in UTF-8 with those control characters escaped that JSON itself allows.
std::string PrintableJson(std::string_view json);

}  // namespace host
