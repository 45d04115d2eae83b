// The word that somebody probably meant.

#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace host {

/// "; did you mean 'program'?" for "porgram"; empty when none of the known words is near, or the
/// word is one of them.
std::string Suggestion(const std::string& word, const std::vector<std::string>& known);

/// Whether two words differ in the case of their letters at most.
bool EqualButForCase(std::string_view one, std::string_view other);

}  // namespace host
