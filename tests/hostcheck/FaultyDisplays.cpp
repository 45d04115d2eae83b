// Hosts that don't take what is to be shown.

#include <cstring>

#include "tests/hostcheck/CheckedHosts.h"

namespace test {

namespace {

const FaultyHost kFaultyDisplays[] = {
    {"ShowMessage: expected null for a text with percent signs and UTF-8; came the error text \"no",
     [](CheckedHost& h) {
         h.message = [](const char* text) { return strchr(text, '%') ? "no format" : nullptr; };
     }},
    {"ShowMessage: expected null for a text of 300 characters; came the error text \"too long\"",
     [](CheckedHost& h) {
         h.message = [](const char* text) { return strlen(text) > 299 ? "too long" : nullptr; };
     }},
    {"ShowMessage: expected null for \"ReadMemory: ok: the identification",
     [](CheckedHost& h) {
         h.message = [](const char* text) -> const char* {
             if (strstr(text, "ok") != nullptr) throw 1;
             return nullptr;
         };
     }},
    {R"(BeginProgress: expected null; came the error text "\xb5\x0a")",
     [](CheckedHost& h) { Fail(h.begin, "\xB5\n"); }},
    {"UpdateProgress: expected null for 0 to 100 percent; came an exception",
     [](CheckedHost& h) { h.update = []() -> const char* { throw 1; }; }},
    {"UpdateProgress: expected null for 0 to 100 percent; came the error text \"full\"",
     [](CheckedHost& h) {
         h.update = [count = 0]() mutable { return ++count > 100 ? "full" : nullptr; };
     }},
    {"UpdateProgress: expected null for fewer percent than before; came the error text \"back\"",
     [](CheckedHost& h) {
         h.update = [count = 0]() mutable { return ++count == 103 ? "back" : nullptr; };
     }},
    {"EndProgress: expected null; came the error text \"no\"",
     [](CheckedHost& h) {
         h.end = [&h] {
             --h.displaysOpen;
             return "no";
         };
     }},
    {"BeginProgress: expected further displays after the first; came the error text \"once\"",
     [](CheckedHost& h) {
         h.begin = [begin = h.begin, count = 0]() mutable {
             return ++count > 5 ? "once" : begin();
         };
     }},
};

}  // namespace

std::span<const FaultyHost> FaultyDisplays() {
    return kFaultyDisplays;
}

}  // namespace test
