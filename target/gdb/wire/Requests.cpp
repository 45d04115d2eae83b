// The table of the requests and how the arguments of each are read.

#include "target/gdb/wire/Requests.h"

#include <limits>
#include <optional>

#include "base/Hex.h"
#include "target/gdb/wire/Fields.h"

namespace target::gdb {

namespace {

using std::string_view;
using Kind = Request::Kind;

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

// Each of these takes what follows a request's name, and is false when that is malformed.

bool Nothing(string_view rest, Request&) {
    return rest.empty();
}

bool Anything(string_view, Request&) {
    return true;
}

bool HexData(string_view rest, Request& request) {
    return StoreHex(rest, request.data);
}

bool RegisterNumber(string_view rest, Request& request) {
    return Store(rest, request.address);
}

bool Range(string_view rest, Request& request) {
    return Store(TakeUntil(rest, ','), request.address) && Store(rest, request.length);
}

bool RegisterValue(string_view rest, Request& request) {
    return Store(TakeUntil(rest, '='), request.address) && StoreHex(rest, request.data);
}

bool HexBytes(string_view rest, Request& request) {
    return Range(TakeUntil(rest, ':'), request) && StoreHex(rest, request.data) &&
           request.data.size() == request.length;
}

bool BinaryBytes(string_view rest, Request& request) {
    if (rest.find(':') == string_view::npos) return false;
    if (!Range(TakeUntil(rest, ':'), request)) return false;
    request.data = rest;
    return request.data.size() == request.length;
}

bool FlashBytes(string_view rest, Request& request) {
    if (!Store(TakeUntil(rest, ':'), request.address)) return false;
    request.data = rest;
    request.length = static_cast<std::uint32_t>(request.data.size());
    return true;
}

bool OptionalAddress(string_view rest, Request& request) {
    request.hasAddress = !rest.empty();
    return rest.empty() || Store(rest, request.address);
}

// "OBJECT:read:ANNEX:OFFSET,LENGTH"
bool Document(string_view rest, Request& request) {
    request.name = TakeUntil(rest, ':');
    if (TakeUntil(rest, ':') != "read") return false;
    request.name += ':';
    request.name += TakeUntil(rest, ':');
    return Range(rest, request);
}

// There is one thread, so the first action that is given is the one that counts.
bool FirstAction(string_view rest, Request& request) {
    const string_view action = TakeUntil(rest, ';');
    const char what = action.empty() ? '\0' : action[0];
    if (what == 's' || what == 'S') request.kind = Kind::Step;
    return what == 's' || what == 'S' || what == 'c' || what == 'C';
}

struct RequestRow {
    string_view name;
    Kind kind;
    bool (*arguments)(string_view rest, Request& request);
};

// A name that another one begins with stands behind that.
constexpr RequestRow kRequestRows[] = {
    {"qSupported", Kind::Supported, Anything},
    {"QStartNoAckMode", Kind::StartNoAckMode, Nothing},
    {"qXfer:", Kind::ReadDocument, Document},
    {"qCRC:", Kind::Checksum, Range},
    {"qRcmd,", Kind::Monitor, HexData},
    {"qfThreadInfo", Kind::FirstThreads, Nothing},
    {"qsThreadInfo", Kind::MoreThreads, Nothing},
    {"qC", Kind::CurrentThread, Nothing},
    {"qAttached", Kind::Attached, Anything},
    {"qSymbol:", Kind::Symbols, Anything},
    {"vFlashErase:", Kind::EraseFlash, Range},
    {"vFlashWrite:", Kind::WriteFlash, FlashBytes},
    {"vFlashDone", Kind::FinishFlash, Nothing},
    {"vCont?", Kind::ResumeKinds, Nothing},
    {"vCont;", Kind::Continue, FirstAction},
    {"v", Kind::Unknown, Anything},
    {"?", Kind::WhyStopped, Nothing},
    {"g", Kind::ReadRegisters, Nothing},
    {"G", Kind::WriteRegisters, HexData},
    {"p", Kind::ReadRegister, RegisterNumber},
    {"P", Kind::WriteRegister, RegisterValue},
    {"m", Kind::ReadMemory, Range},
    {"M", Kind::WriteMemory, HexBytes},
    {"X", Kind::WriteMemory, BinaryBytes},
    {"c", Kind::Continue, OptionalAddress},
    {"s", Kind::Step, OptionalAddress},
    {"H", Kind::ChooseThread, Anything},
    {"T", Kind::ThreadAlive, Anything},
    {"D", Kind::Detach, Anything},
    {"k", Kind::Kill, Nothing},
};

}  // namespace

Request ParseRequest(string_view payload) {
    for (const RequestRow& row : kRequestRows) {
        if (!payload.starts_with(row.name)) continue;
        Request request;
        request.kind = row.kind;
        if (row.arguments(payload.substr(row.name.size()), request)) return request;
        return {.malformed = true, .name = std::string(row.name)};
    }
    return {.name = std::string(payload.substr(0, 20))};
}

}  // namespace target::gdb
