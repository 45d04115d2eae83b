// What is done with the option table: parse, check, write, compare, explain.

#include "target/simulated/options/DeviceOptions.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <string_view>

#include "base/Hex.h"
#include "target/simulated/options/DeviceClass.h"
#include "target/simulated/options/OptionTable.h"
#include "target/simulated/options/OptionValues.h"

namespace target {

namespace {

using std::string_view;

// Options go from text to value in one pass, each checked by itself. What depends on two of them is
// checked afterwards, for they come in any order, and once more when a kept device is opened with
// options of today. An OptionError leaves nothing half set: the value is thrown away with it.

constexpr char kClass[] = "class";

[[noreturn]] void ThrowBadValue(string_view name, string_view value, string_view why) {
    throw OptionError(
        fmt::format("Option \"{}={}\" of the simulated device: {}.", name, value, why));
}

// The identification holds the revision; the rest of the device has no say in that.
void RequireOneRevision(const DeviceOptions& options) {
    if (options.given.contains("id") && options.given.contains("revision")) {
        ThrowBadValue("id", RegisterText(options.identification),
                      "the identification holds the revision already; leave \"revision\" out");
    }
}

// What only shows once it is known which device the options are for.
void CheckTogether(const DeviceOptions& options) {
    if (options.given.contains("sector") && !HasSizeRegisters(options)) {
        ThrowBadValue("sector", FormatSize(options.sectorSizeBytes),
                      fmt::format("a {} has sectors of 1K and no register to report others; leave "
                                  "it out, or use class velk or dorna",
                                  options.className));
    }
    const auto& stuck = options.faults.stuckCell;
    if (stuck && stuck->address >= options.flashSizeBytes) {
        ThrowBadValue("stuck-cell", RegisterText(stuck->address),
                      fmt::format("the flash ends at 0x{:X}", options.flashSizeBytes));
    }
}

void ParseOption(DeviceOptions& options, string_view text) {
    const std::size_t equals = std::min(text.find('='), text.size());
    const string_view name = text.substr(0, equals);
    const auto table = OptionTable();
    const auto row = std::find_if(table.begin(), table.end(),
                                  [name](const OptionRow& r) { return r.name == name; });
    if (row == table.end() || equals == text.size()) {
        throw OptionError(
            fmt::format("Option \"{}\" of the simulated device: the form is NAME=VALUE, with one "
                        "of the names {}.",
                        text, fmt::join(DeviceOptionNames(), ", ")));
    }
    const string_view value = text.substr(equals + 1);
    if (!options.given.insert(row->name).second) {
        ThrowBadValue(name, value, "the option is given twice; leave one out");
    }
    if (!row->set(options, value)) {
        ThrowBadValue(name, value, fmt::format("accepted is {}", row->accepts));
    }
}

}  // namespace

// The class comes first: it brings the defaults that the other options replace.
DeviceOptions ParseDeviceOptions(const std::string& text) {
    string_view rest = text;
    const auto nextItem = [&rest] {
        const std::size_t end = std::min(rest.find(','), rest.size());
        const string_view item = rest.substr(0, end);
        rest.remove_prefix(std::min(end + 1, rest.size()));
        return item;
    };
    DeviceOptions options = DefaultDeviceOptions(std::string(nextItem()));
    options.given.insert(kClass);
    while (!rest.empty())
        ParseOption(options, nextItem());
    RequireOneRevision(options);
    return options;
}

// `given` stays empty: a default contradicts nobody.
DeviceOptions DefaultDeviceOptions(const std::string& className) {
    const DeviceClass* row = FindDeviceClass(className);
    if (row == nullptr) {
        throw OptionError(fmt::format("Device class \"{}\" of the simulated device: use one of {}.",
                                      className, fmt::join(DeviceClassNames(), ", ")));
    }
    DeviceOptions options;
    options.className = row->name;
    options.identification = row->identification;
    options.flashSizeBytes = row->flashSizeBytes;
    options.ramSizeBytes = row->ramSizeBytes;
    options.sectorSizeBytes = row->sectorSizeBytes;
    options.keyConfiguration = row->keyConfiguration;
    return options;
}

// The value may have been made by hand. Its text is parsed back, so that one set of limits serves
// both.
void CheckDeviceOptions(const DeviceOptions& options) {
    CheckTogether(options);
    ParseDeviceOptions(DefinitionText(options));
}

// Kept in contents files: a name in it can't be changed any more.
std::string DefinitionText(const DeviceOptions& options) {
    std::string text = options.className;
    for (const OptionRow& row : OptionTable()) {
        const string_view name = row.name;
        // The identification says both: what the revision is, and whether the sector size shows.
        if (row.definition == nullptr || name == "revision") continue;
        if (name == "sector" && !HasSizeRegisters(options)) continue;
        text += fmt::format(",{}={}", name, row.definition(options));
    }
    return text;
}

DeviceOptions ReopenOptions(const DeviceOptions& kept, const DeviceOptions& today) {
    const auto check = [&today](const std::string& name, const std::string& now,
                                const std::string& then) {
        if (!today.given.contains(name) || now == then) return;
        throw OptionError(
            fmt::format("Option \"{}\" of the simulated device: {} is asked for, but the kept "
                        "device has {}; leave the option out, or keep this device in another file.",
                        name, now, then));
    };
    check(kClass, today.className, kept.className);
    for (const OptionRow& row : OptionTable()) {
        if (row.definition != nullptr) check(row.name, row.definition(today), row.definition(kept));
    }
    DeviceOptions reopened = kept;
    reopened.timings = today.timings;
    reopened.faults = today.faults;
    // The checks that follow name what the user gave, not what was kept.
    reopened.given = today.given;
    return reopened;
}

std::string DeviceClassesHelp() {
    std::string text = fmt::format("  {:<7} {:<6} {:<5} {:<7} {:<11} {}\n", "", "flash", "ram",
                                   "sector", "id", "keyconfig");
    for (const DeviceClass& one : DeviceClasses())
        text += fmt::format("  {:<7} {:<6} {:<5} {:<7} {:<11} {}\n", one.name,
                            FormatSize(one.flashSizeBytes), FormatSize(one.ramSizeBytes),
                            FormatSize(one.sectorSizeBytes), RegisterText(one.identification),
                            RegisterText(one.keyConfiguration));
    return text;
}

std::string DeviceOptionsHelp() {
    std::string text;
    for (const OptionRow& row : OptionTable())
        text += fmt::format("  {:<17}{} ({})\n", row.name, row.meaning, row.accepts);
    return text;
}

const std::vector<std::string>& DeviceClassNames() {
    static const std::vector<std::string> names = [] {
        std::vector<std::string> all;
        for (const DeviceClass& row : DeviceClasses())
            all.emplace_back(row.name);
        return all;
    }();
    return names;
}

const std::vector<std::string>& DeviceOptionNames() {
    static const std::vector<std::string> names = [] {
        std::vector<std::string> all;
        for (const OptionRow& row : OptionTable())
            all.emplace_back(row.name);
        return all;
    }();
    return names;
}

}  // namespace target
