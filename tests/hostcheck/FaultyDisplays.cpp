// Hosts that don't take what is to be shown.

#include <cstring>

#include "tests/hostcheck/CheckedHosts.h"

namespace test {

namespace {

using H = CheckedHost;

const FaultyHost kFaultyDisplays[] = {
    {"expected null for a text with percent signs and UTF-8; came the error text \"no",
     On(&H::message, [](auto&, auto&, auto* text) { return strchr(text, '%') ? "no" : nullptr; })},
    {"expected null for a text of 300 characters; came the error text \"too long\"",
     On(&H::message,
        [](auto&, auto&, auto* text) { return strlen(text) > 299 ? "too long" : nullptr; })},
    {"ShowMessage: expected null for \"ReadMemory: ok: the identification",
     On(&H::message,
        [](auto&, auto&, auto* text) { return strstr(text, "ok") ? throw 1 : nullptr; })},
    {"BeginProgress: expected null; came the error text \"\\xb5\\x0a\"",
     Failing(&H::begin, "\xB5\n")},
    {"UpdateProgress: expected null for 0 to 100 percent; came an exception",
     On(&H::update, [](auto&...) -> const char* { throw 1; })},
    {"UpdateProgress: expected null for 0 to 100 percent; came the error text \"full\"",
     On(&H::update, [n = 0](auto&...) mutable { return ++n > 100 ? "full" : nullptr; })},
    {"expected null for fewer percent than before; came the error text \"back\"",
     On(&H::update, [n = 0](auto&...) mutable { return ++n == 103 ? "back" : nullptr; })},
    {"EndProgress: expected null; came the error text \"no\"",
     On(&H::end, [](H& h, auto&) { return --h.displaysOpen, "no"; })},
    {"expected further displays after the first; came the error text \"once\"",
     On(&H::begin, [n = 0](auto&, auto& begin) mutable { return ++n > 5 ? "once" : begin(); })},
};

}  // namespace

std::span<const FaultyHost> FaultyDisplays() {
    return kFaultyDisplays;
}

}  // namespace test
