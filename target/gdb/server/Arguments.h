// What stands behind the name of a request, read by one function for each form that it can have.

#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace target::gdb {

/// Which members an argument function sets, it says.
struct Arguments {
    std::uint32_t address = 0;
    std::uint32_t length = 0;
    bool hasAddress = false;
    bool step = false;
    std::string name = {};
    std::string data = {};  ///< as bytes
};

/// Reads what follows a request's name. False when it is malformed; `arguments` then hold anything.
/// Addresses and lengths fit 32 bits, and data has the length that was announced.
using ReadArguments = bool (*)(std::string_view rest, Arguments& arguments);

bool Nothing(std::string_view rest, Arguments& arguments);
bool Anything(std::string_view rest, Arguments& arguments);         ///< sets nothing
bool HexData(std::string_view rest, Arguments& arguments);          ///< data
bool RegisterNumber(std::string_view rest, Arguments& arguments);   ///< address: the number
bool RegisterValue(std::string_view rest, Arguments& arguments);    ///< the same; data
bool Range(std::string_view rest, Arguments& arguments);            ///< address, length
bool HexBytes(std::string_view rest, Arguments& arguments);         ///< address, length, data
bool BinaryBytes(std::string_view rest, Arguments& arguments);      ///< address, length, data
bool FlashBytes(std::string_view rest, Arguments& arguments);       ///< address, length, data
bool OptionalAddress(std::string_view rest, Arguments& arguments);  ///< address, hasAddress
bool Breakpoint(std::string_view rest, Arguments& arguments);       ///< address; length: its kind
bool FirstAction(std::string_view rest, Arguments& arguments);      ///< step

/// name: "features:target.xml", the object and its annex; address: the offset; length.
bool Document(std::string_view rest, Arguments& arguments);

}  // namespace target::gdb
