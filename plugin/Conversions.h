// The conversions between setting texts and numbers that the whole library shares. None of them
// depends on the locale of the process that has loaded the library.

#pragma once

#include <cstdint>
#include <string>

/// The address form: a hexadecimal number, with or without "0x", after leading white space;
/// whatever follows it is ignored. Never fails: a text without such a number gives 0, a number
/// too large 0xFFFFFFFF.
std::uint32_t ParseHex(const std::string& text);

/// Lower-case hexadecimal digits without prefix and leading zeros.
std::string ToHexText(std::uint32_t value);

std::string ToDecimalText(std::uint32_t value);

/// "1" is true, "0" is false, each also behind zeros and a sign that changes nothing ("+1",
/// "-0"). Throws boost::bad_lexical_cast for any other text.
bool ParseBoolean(const std::string& text);

/// A signed 32-bit decimal number and nothing else. Throws boost::bad_lexical_cast.
std::int32_t ParseInteger(const std::string& text);

/// The signed 32-bit decimal number that the text begins with, after leading white space;
/// whatever follows it is ignored. Throws std::invalid_argument "invalid stoi argument" when
/// there is none, std::out_of_range "stoi argument out of range" when it does not fit.
std::int32_t ParseDecimal(const std::string& text);
