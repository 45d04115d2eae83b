// Words are near when few letters must be changed, left out, added or swapped with a neighbour.

#include "host/base/Suggestion.h"

#include <fmt/format.h>

#include <algorithm>
#include <utility>

namespace host {

namespace {

char Lower(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

bool Equal(char one, char other) {
    return Lower(one) == Lower(other);
}

/// Row by row: `row[j]` is the distance of the first i letters of one word to the first j of the
/// other; a swap looks two rows up.
std::size_t Distance(const std::string& one, const std::string& other) {
    std::vector<std::size_t> row(other.size() + 1);
    for (std::size_t j = 0; j <= other.size(); ++j)
        row[j] = j;
    std::vector<std::size_t> above = row;
    for (std::size_t i = 1; i <= one.size(); ++i) {
        const std::vector<std::size_t> twoAbove = std::exchange(above, row);
        row[0] = i;
        for (std::size_t j = 1; j <= other.size(); ++j) {
            const std::size_t change = Equal(one[i - 1], other[j - 1]) ? 0 : 1;
            row[j] = std::min({above[j] + 1, row[j - 1] + 1, above[j - 1] + change});
            const bool swapped = i > 1 && j > 1 && Equal(one[i - 1], other[j - 2]) &&
                                 Equal(one[i - 2], other[j - 1]);
            if (swapped) row[j] = std::min(row[j], twoAbove[j - 2] + 1);
        }
    }
    return row.back();
}

}  // namespace

std::string Suggestion(const std::string& word, const std::vector<std::string>& known) {
    constexpr std::size_t kLongestWord = 64;
    if (word.size() > kLongestWord || std::count(known.begin(), known.end(), word) != 0) return {};
    const std::string* nearest = nullptr;
    std::size_t least = std::max<std::size_t>(1, word.size() / 3) + 1;
    for (const std::string& candidate : known) {
        const std::size_t distance = Distance(word, candidate);
        if (distance < std::min(least, word.size())) {
            nearest = &candidate;
            least = distance;
        }
    }
    return nearest == nullptr ? "" : fmt::format("; did you mean '{}'?", *nearest);
}

bool EqualButForCase(std::string_view one, std::string_view other) {
    return std::equal(one.begin(), one.end(), other.begin(), other.end(), Equal);
}

}  // namespace host
