// Hosts whose fault is a value: the rows of faults.txt.

#include <map>
#include <memory>
#include <utility>

#include "tests/hostcheck/CheckedHosts.h"
#include "tests/support/Cases.h"

namespace test {

namespace {

using std::string;
using H = CheckedHost;

/// A slot that always returns that text.
Spoil Returning(const string& slot, const string& text) {
    static const std::map<string, void (*)(H&, const char*)> kSlots = {
        {"begin", [](H& h, const char* returned) { Fail(h.begin, returned); }},
        {"directory", [](H& h, const char* returned) { Fail(h.directory, returned); }},
        {"halt", [](H& h, const char* returned) { Fail(h.halt, returned); }},
        {"load", [](H& h, const char* returned) { Fail(h.load, returned); }},
        {"reset", [](H& h, const char* returned) { Fail(h.reset, returned); }},
        {"run", [](H& h, const char* returned) { Fail(h.run, returned); }},
        {"set", [](H& h, const char* returned) { Fail(h.set, returned); }},
        {"sleep", [](H& h, const char* returned) { Fail(h.sleep, returned); }},
    };
    const auto kept = text == "(null)" ? nullptr : std::make_shared<string>(Unescaped(text));
    return [=, fail = kSlots.at(slot)](H& h) { fail(h, kept ? kept->c_str() : nullptr); };
}

Spoil SpoilOf(const string& fault) {
    const std::vector<string> words = Split(fault, " ");
    const string rest = fault.substr(std::min(words[0].size() + 1, fault.size()));
    if (words[0] == "without")
        return [=](H& h) {
            for (const string& name : words)
                std::erase_if(h.settings, [&](auto& row) { return row.first.starts_with(name); });
        };
    if (words[0] == "setting") return [=](H& h) { h.settings[words.at(1)] = words.at(2); };
    if (words[0] == "register")
        return [=](H& h) {
            h.target.registers[std::stoul(words.at(1), nullptr, 16)] =
                static_cast<uint32_t>(std::stoul(words.at(2), nullptr, 16));
        };
    if (words[0] == "chunk-time")
        return [=](H& h) { h.target.chunkTime = std::chrono::milliseconds(std::stoi(rest)); };
    if (words[0] != "halt-after") return Returning(words[0], rest);
    return On(&H::halt, [rest, failed = false](H& h, auto& halt) mutable {
        return h.Told(rest) && !std::exchange(failed, true) ? "no" : halt();
    });
}

}  // namespace

std::vector<FaultyHost> FaultyValues() {
    std::vector<FaultyHost> faults;
    for (const auto& row : ReadTable("hostcheck/faults.txt", 2)) {
        std::vector<Spoil> spoils;
        for (const string& fault : Split(row[0], "; "))
            spoils.push_back(SpoilOf(fault));
        const bool wholeEnd = row[1].ends_with("\\n");
        faults.push_back(
            {wholeEnd ? row[1].substr(0, row[1].size() - 2) + "\n" : row[1], [spoils](H& h) {
                 for (const Spoil& spoil : spoils)
                     spoil(h);
             }});
    }
    return faults;
}

}  // namespace test
