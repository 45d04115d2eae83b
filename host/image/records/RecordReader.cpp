// Lines, pairs of digits, and the complaints about them that name file, line and column.

#include "host/image/records/RecordReader.h"

#include <fmt/format.h>

#include <algorithm>
#include <numeric>

#include "base/Hex.h"
#include "host/base/Errors.h"

namespace host::image {
namespace {

constexpr std::string_view kBlanks = " \t\r";

std::string_view Trimmed(std::string_view line) {
    line = line.substr(0, line.find_last_not_of(kBlanks) + 1);  // npos + 1 is 0: nothing is left
    return line.substr(std::min(line.find_first_not_of(kBlanks), line.size()));
}

/// A character as an error text can show it on any terminal.
std::string Shown(char c) {
    return c > ' ' && c <= '~' ? fmt::format("'{}'", c)
                               : fmt::format("byte 0x{:02X}", static_cast<unsigned char>(c));
}

}  // namespace

std::uint8_t ByteSum(Bytes bytes) {
    return static_cast<std::uint8_t>(std::accumulate(bytes.begin(), bytes.end(), 0U));
}

bool RecordReader::NextLine() {
    while (!rest_.empty()) {
        const std::size_t end = std::min(rest_.find('\n'), rest_.size());
        line_ = Trimmed(rest_.substr(0, end));
        rest_.remove_prefix(std::min(end + 1, rest_.size()));
        ++lineNumber_;
        if (!line_.empty()) return true;
    }
    return false;
}

Bytes RecordReader::DecodeFrom(std::size_t column) {
    const std::string_view digits = line_.substr(column);
    const std::size_t count = digits.size() / 2;
    if (count > bytes_.size()) {
        FailDamaged(fmt::format("{} characters found, more than any record has", line_.size()));
    }
    for (std::size_t i = 0; i < count; ++i) {
        const int high = base::HexDigitValue(digits[2 * i]);
        const int low = base::HexDigitValue(digits[2 * i + 1]);
        if ((high | low) < 0) FailAtDigit(column + 2 * i + (high < 0 ? 0 : 1));
        bytes_[i] = static_cast<std::uint8_t>(high << 4 | low);
    }
    if (digits.size() % 2 != 0) {
        FailDamaged(fmt::format("{} hexadecimal digits found, pairs expected", digits.size()));
    }
    return Bytes(bytes_).first(count);
}

void RecordReader::RequireSize(std::size_t found, std::size_t expected) const {
    if (found == expected) return;
    FailDamaged(
        fmt::format("a record of {} bytes found, {} expected by its length byte", found, expected));
}

void RecordReader::RequireChecksum(std::uint8_t found, std::uint8_t expected) const {
    if (found == expected) return;
    FailDamaged(fmt::format("checksum 0x{:02X} found, 0x{:02X} expected", found, expected));
}

void RecordReader::FailHere(const std::string& text) const {
    Fail(fmt::format("line {}: {}", lineNumber_, text));
}

void RecordReader::Fail(const std::string& text) const {
    throw Failure(ExitStatus::BadFile, fmt::format("{}: {}", name_, text));
}

void RecordReader::FailDamaged(const std::string& text) const {
    FailHere(text + "; the line is damaged or cut off: fetch or make the file anew");
}

void RecordReader::FailAtDigit(std::size_t column) const {
    FailDamaged(fmt::format("{} found in column {}, a hexadecimal digit expected",
                            Shown(line_[column]), column + 1));
}

}  // namespace host::image
