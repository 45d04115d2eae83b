// Numbers are hexadecimal, and bytes are pairs of digits or stand as they are.

#include "target/gdb/server/Arguments.h"

#include <limits>
#include <optional>

#include "base/Hex.h"
#include "target/gdb/wire/Fields.h"

namespace target::gdb {

namespace {

using std::string_view;

bool Store(string_view digits, std::uint32_t& member) {
    const auto number = base::ParseHexDigits(digits);
    if (!number || *number > std::numeric_limits<std::uint32_t>::max()) return false;
    member = static_cast<std::uint32_t>(*number);
    return true;
}

bool StoreHex(string_view digits, std::string& member) {
    auto bytes = base::FromHex(digits);
    if (bytes) member = std::move(*bytes);
    return bytes.has_value();
}

/// "c", "s", or one of them with a signal.
bool IsAction(string_view action) {
    if (action == "c" || action == "s") return true;
    return (action.starts_with('C') || action.starts_with('S')) && action.size() == 3 &&
           base::ParseHexDigits(action.substr(1));
}

/// One thread, all of them, or those of a process: "1", "-1", "p1.-1"; nothing means all.
bool AreThreads(string_view threads) {
    const auto isNumber = [](string_view text) {
        return text == "-1" || base::ParseHexDigits(text).has_value();
    };
    if (threads.empty()) return true;
    if (!threads.starts_with('p')) return isNumber(threads);
    threads.remove_prefix(1);
    const string_view process = TakeUntil(threads, '.');
    return isNumber(process) && (threads.empty() || isNumber(threads));
}

}  // namespace

bool Nothing(string_view rest, Arguments&) {
    return rest.empty();
}

bool Anything(string_view, Arguments&) {
    return true;
}

bool HexData(string_view rest, Arguments& arguments) {
    return StoreHex(rest, arguments.data);
}

bool RegisterNumber(string_view rest, Arguments& arguments) {
    return Store(rest, arguments.address);
}

bool RegisterValue(string_view rest, Arguments& arguments) {
    return Store(TakeUntil(rest, '='), arguments.address) && StoreHex(rest, arguments.data);
}

bool Range(string_view rest, Arguments& arguments) {
    return Store(TakeUntil(rest, ','), arguments.address) && Store(rest, arguments.length);
}

bool HexBytes(string_view rest, Arguments& arguments) {
    return Range(TakeUntil(rest, ':'), arguments) && StoreHex(rest, arguments.data) &&
           arguments.data.size() == arguments.length;
}

bool BinaryBytes(string_view rest, Arguments& arguments) {
    if (rest.find(':') == string_view::npos) return false;
    if (!Range(TakeUntil(rest, ':'), arguments)) return false;
    arguments.data = rest;
    return arguments.data.size() == arguments.length;
}

bool FlashBytes(string_view rest, Arguments& arguments) {
    if (!Store(TakeUntil(rest, ':'), arguments.address)) return false;
    arguments.data = rest;
    arguments.length = static_cast<std::uint32_t>(arguments.data.size());
    return true;
}

bool OptionalAddress(string_view rest, Arguments& arguments) {
    arguments.hasAddress = !rest.empty();
    return rest.empty() || Store(rest, arguments.address);
}

bool Breakpoint(string_view rest, Arguments& arguments) {
    const string_view kind = TakeUntil(rest, ',');
    return kind.size() == 1 && kind[0] >= '0' && kind[0] <= '4' &&
           Range(TakeUntil(rest, ';'), arguments);
}

// There is one thread, so the first action that is given is the one that counts.
bool FirstAction(string_view rest, Arguments& arguments) {
    for (bool first = true; first || !rest.empty(); first = false) {
        string_view threads = TakeUntil(rest, ';');
        const string_view action = TakeUntil(threads, ':');
        if (!IsAction(action) || !AreThreads(threads)) return false;
        if (first) arguments.step = action[0] == 's' || action[0] == 'S';
    }
    return true;
}

// "OBJECT:read:ANNEX:OFFSET,LENGTH"
bool Document(string_view rest, Arguments& arguments) {
    arguments.name = TakeUntil(rest, ':');
    if (TakeUntil(rest, ':') != "read") return false;
    arguments.name += ':';
    arguments.name += TakeUntil(rest, ':');
    return Range(rest, arguments);
}

}  // namespace target::gdb
