#include "plugin/Conversions.h"

#include <array>
#include <charconv>
#include <locale>
#include <sstream>
#include <stdexcept>

// Without this, Boost accepts the digit grouping of the global locale in integers.
#define BOOST_LEXICAL_CAST_ASSUME_C_LOCALE
#include <boost/lexical_cast.hpp>

std::uint32_t ParseHex(const std::string& text) {
    std::istringstream stream(text);
    stream.imbue(std::locale::classic());
    std::uint32_t value = 0;
    stream >> std::hex >> value;
    return value;
}

std::string ToHexText(std::uint32_t value) {
    std::array<char, 8> digits{};
    const auto end = std::to_chars(digits.begin(), digits.end(), value, 16).ptr;
    return std::string(digits.begin(), end);
}

std::string ToDecimalText(std::uint32_t value) {
    return std::to_string(value);
}

bool ParseBoolean(const std::string& text) {
    return boost::lexical_cast<bool>(text);
}

std::int32_t ParseInteger(const std::string& text) {
    return boost::lexical_cast<std::int32_t>(text);
}

std::int32_t ParseDecimal(const std::string& text) {
    const auto first = text.find_first_not_of(" \t\n\v\f\r");
    std::string digits = first == std::string::npos ? std::string() : text.substr(first);
    // from_chars knows no plus sign; taking it away must not let "+-1" through.
    if (digits.starts_with('+') && !digits.starts_with("+-")) digits.erase(0, 1);

    std::int32_t value = 0;
    const auto error = std::from_chars(digits.data(), digits.data() + digits.size(), value).ec;
    if (error == std::errc::invalid_argument) throw std::invalid_argument("invalid stoi argument");
    if (error != std::errc()) throw std::out_of_range("stoi argument out of range");
    return value;
}
