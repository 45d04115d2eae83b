// Laying out terms and what they mean, wrapped for a terminal or for a page of 79 columns.

#pragma once

#include <string>
#include <string_view>

#include "host/cli/CommandTable.h"

namespace host {

/// Words from `text`, wrapped so that all lines but the first are indented. The first one begins
/// at `column`.
std::string Wrap(std::string_view text, std::size_t column = 0, std::size_t indent = 0);

/// A term and what it means: beside it, or below one that is too long or on a narrow terminal.
std::string Entry(const std::string& term, std::string_view text, std::size_t termColumns = 24);

/// The entry of an option or of an argument.
std::string OptionEntry(const OptionRow& row);

}  // namespace host
