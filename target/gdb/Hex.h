// Hexadecimal digits, in which the protocol writes numbers and most of its bytes.

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace target::gdb {

/// 0 to 15, or -1 for what is no hexadecimal digit.
int HexValue(char digit);

/// Two lower-case digits for each byte.
std::string ToHex(std::string_view bytes);

/// The bytes of a whole text of digit pairs, which may be empty; nothing for any other text.
std::optional<std::string> FromHex(std::string_view digits);

/// The four bytes of a word or register, which the protocol hands on least significant byte first.
std::string LittleEndian(std::uint32_t value);

/// A number of up to 64 bits, most significant digit first, with nothing around it.
std::optional<std::uint64_t> HexNumber(std::string_view digits);

/// The text up to the first `separator`, which is taken off `rest` with it; all of `rest` where
/// there is none.
std::string_view TakeUntil(std::string_view& rest, char separator);

}  // namespace target::gdb
