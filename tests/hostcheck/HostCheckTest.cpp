// The host check finds what a host does wrong: tables of hosts with one fault each, and the line
// that names it. It survives all of them, does no harm, and accuses nobody else.

#include <dlfcn.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <sstream>

#include "tests/hostcheck/CheckedHosts.h"
#include "tests/support/Cases.h"

namespace test {

namespace {

using std::string;
using H = CheckedHost;

std::vector<FaultyHost> AllFaultyHosts() {
    std::vector<FaultyHost> all = FaultyValues();
    for (const auto table : {FaultySettings(), FaultyMemory(), FaultyCores(), FaultyDisplays()})
        all.insert(all.end(), table.begin(), table.end());
    return all;
}

string FirstLine(const string& text) {
    return text.substr(0, text.find('\n') + 1);
}

// Each host is told its fault and no other. Each rule has a host that breaks it and nothing before
// it: a rule that finds nothing would be none.
TEST(HostCheck, FindsTheFaultOfEachHostAndNothingInAGoodOne) {
    CheckedHost good;
    const std::vector<unsigned char> flash = good.target.flash;
    EXPECT_EQ(good.Faults(), "");
    // Who hangs with the check reads what it was about to do.
    for (const char* line : {"ResetSettings: ok: 0, sections and 2, which is a whole load",
                             "RunTarget: called now", "HaltTarget: called now"})
        EXPECT_TRUE(good.Told(line)) << line;
    EXPECT_EQ(std::memcmp(good.target.ram.data() + 0x1840, string(64, '\0').data(), 64), 0);
    std::vector<string> found;
    for (const FaultyHost& row : AllFaultyHosts()) {
        CheckedHost host;
        row.spoil(host);
        found.push_back(FirstLine(host.Faults()));
        EXPECT_NE(found.back().find(row.found), string::npos) << found.back() << row.found;
        EXPECT_FALSE(host.displaysOpen > 0) << row.found;
        const bool harmless = found.back().find("the flash as it was;") == string::npos;
        EXPECT_EQ(host.target.flash == flash, harmless) << row.found;
    }
    int rules = 0;
    for (const string& line : good.lines) {
        const size_t ok = line.find(": ok: ");
        if (ok == string::npos || line.starts_with("ResetSettings")) continue;
        ++rules;
        const string rule = "error: " + line.substr(0, ok) + ": expected " +
                            line.substr(ok + 6, line.find(';', ok) - ok - 6) + "; came";
        EXPECT_TRUE(std::ranges::any_of(found, [&](const string& text) {
            return text.starts_with(rule);
        })) << rule;
    }
    EXPECT_GT(rules, 60);
}

TEST(HostCheck, JudgesTextsOfSettingsAsThePluginReadsThem) {
    for (const auto& row : ReadTable("hostcheck/setting-texts.txt", 3)) {
        CheckedHost host;
        host.settings[row[0]] = row[1];
        const string blamed =
            row[2] == "good" ? ""
                             : "error: GetProperty: expected values that the plug-in can read; "
                               "came \"" +
                                   row[1] + "\" for " + row[0] + ", which takes ";
        const string faults = host.Faults();
        EXPECT_EQ(blamed.empty() ? faults : faults.substr(0, blamed.size()), blamed) << row[1];
    }
}

/// Hosts that differ from the good one, and rightly.
const struct {
    const char* told;  ///< among the lines
    Spoil change;
} kOtherGoodHosts[] = {
    {"FlashCrystalFreq is unknown", [](H& h) { h.settings.erase("FlashCrystalFreq"); }},
    // A store for 63 characters; one in which what is empty is not there.
    {"", On(&H::set,
            [](auto&, auto& set, auto* name, auto* value) {
                return std::max(strlen(name), strlen(value)) > 62 ? "no room" : set(name, value);
            })},
    {"", On(&H::get,
            [](auto&, auto& get, const string& name) {
                return name.starts_with("DeviceInfo") ? nullptr : get(name.c_str());
            })},
    {"Sleep: not checked: pauses that last as long as was asked; the setting HostSimulatesTime is "
     "1",
     [](H& h) {
         h.settings["HostSimulatesTime"] = "1";
         Fail(h.sleep, nullptr);
     }},
    {"0x00000001 and 0x00000007 in them", On(&H::load,
                                             [](H& h, auto&) {
                                                 h.target.SetStatus(0, 1);
                                                 return h.target.SetStatus(1, 7), nullptr;
                                             })},
    {"not checked: 32752 bytes of flash in one call; it can't be read in small pieces: the error",
     [](H& h) { h.target.flash.resize(16384); }},
    {"all of it is ff, so that parts in a wrong order wouldn't show",
     [](H& h) { std::ranges::fill(h.target.flash, 0xFF); }},
    {"the sizes of the device make no sense either way",
     [](H& h) { h.target.registers[0x400FDFC4] = 0; }},
    {"not checked: flash as it is now, not as it was read before; after a reset, no ROM",
     On(&H::reset,
        [](H& h, auto& reset, bool flag) {
            const char* const error = reset(flag);
            h.target.romInFront = false;
            return h.target.registers[0x400FE0F0] = 0, error;
        })},
    {"it reads 0x00030200",
     [](H& h) {
         h.target.registers[0x400FE000] = 0x00030200;
         h.target.registers[0x400FE008] = 0x003F001F;
     }},
    // Reads of flash in whole pieces of its own.
    {"",
     [](H& h) {
         Bent([](Transfer& t, auto&) {
             if (t.Reads() && t.width == 1) t.count = std::max<size_t>(t.count, 128);
         })(h);
         h.target.flash.resize(33000);
     }},
    {"", [](H& h) { h.target.chunkTime = std::chrono::milliseconds(0); }},
    {"a loader that takes two chunks",
     [](H& h) { h.target.chunkTime = std::chrono::milliseconds(400); }},
    {"it is \"..\\\"", Failing(&H::directory, "..\\")},
};

TEST(HostCheck, AccusesNoOtherGoodHost) {
    for (const auto& [told, change] : kOtherGoodHosts) {
        CheckedHost host;
        change(host);
        EXPECT_EQ(host.Faults(), "") << told;
        EXPECT_TRUE(host.Told(told)) << told;
    }
}

TEST(HostCheck, ReturnsWhatTheHostCannotShow) {
    CheckedHost host;
    host.errorsFail = true;
    Fail(host.sleep, nullptr);
    EXPECT_NE(host.Faults().find("returned: ShowError: expected null for \"Sleep: "), string::npos);
    EXPECT_TRUE(host.Told("Host check, Initialize: 37 of 38 hold"));
}

TEST(HostCheck, StartsNoLoaderOnLeftovers) {
    CheckedHost host;
    host.load = [&host] {
        Fail(host.move, "no probe");
        return nullptr;
    };
    host.Faults([&](IFlashDevice2& d) {
        host.target.SetStatus(0, 0xFFFFFFFF);
        return d.PerformOperation("CheckLoader");
    });
    EXPECT_FALSE(host.target.running || host.loaderRuns);
    EXPECT_TRUE(
        host.Told("RunTarget: not checked: null for the loader, at once; a status word may"));
    EXPECT_TRUE(host.Told("Host check, CheckLoader: 8 of 9 hold, 13 not checked"));
}

TEST(HostCheck, JudgesEachLoaderByItself) {
    CheckedHost host;
    host.Faults([&host](IFlashDevice2& d) {
        EXPECT_EQ(d.PerformOperation("CheckLoader"), nullptr);
        host.target.chunkTime = std::chrono::hours(1);
        return d.PerformOperation("CheckLoader");
    });
    EXPECT_TRUE(host.Told("; the loader takes no chunks"));
}

/// What a call returned; "yes" or "no" where it was asked something.
const char* Call(IFlashDevice2& device, const string& call) {
    static const unsigned char data[200] = {};
    static const unsigned char* const none = nullptr;
    std::istringstream words(call);
    string name;
    string operation;
    uint64_t first = 0;
    int64_t length = 0;
    words >> name;
    if (name == "perform") return words >> operation, device.PerformOperation(operation.c_str());
    words >> first >> length;
    bool yes = name == "special";
    const auto count = static_cast<uint32_t>(length);
    const auto size = static_cast<int32_t>(length);
    if (name == "reset") return device.ResetSettings(static_cast<int>(first));
    if (name == "write") return device.WriteDataToFlash(data, first, count, 1);
    if (name == "write-nothing") return device.WriteDataToFlash(none, first, count, 1);
    if (name == "write-halfwords")
        return device.WriteDataToFlash(static_cast<const uint16_t*>(nullptr), first, count, 1);
    if (name == "perform-nothing") return device.PerformOperation(kNoText);
    if (name == "within-null") return device.AddressWithinFlash(0, nullptr);
    const char* error = "no such call";
    if (name == "initialize-null") error = device.Initialize(nullptr, &error);
    if (name == "within") error = device.AddressWithinFlash(first, &yes);
    if (name == "range-within") error = device.AddressWithinFlash(first, size, &yes);
    if (name == "special") error = device.AddressWithinSpecialRegion(first, &yes);
    return error != nullptr ? error : yes ? "yes" : "no";
}

TEST(HostCheck, LooksAtTheCallsOfTheHostToo) {
    for (const auto& row : ReadTable("hostcheck/calls.txt", 2)) {
        const string faults = CheckedHost().Faults([&](IFlashDevice2& device) {
            const char* error = nullptr;
            for (const string& call : Split(row[0], "; "))
                error = Call(device, call);
            return error;
        });
        EXPECT_EQ(faults, row[1].empty() ? "" : row[1] + "\n");
    }
    CheckedHost host;
    const string faults = host.Faults([&](IFlashDevice2& d) {
        host.begin = [&d] { return d.ResetSettings(0); };
        return d.PerformOperation("CheckProgress");
    });
    EXPECT_TRUE(faults.starts_with(
        "error: BeginProgress: expected null; came the error text \"called before"));
    EXPECT_NE(faults.find("expected no other call before this one has returned"), string::npos);
}

TEST(HostCheck, WantsAHostAndAPlaceForTheDevice) {
    void* const library = dlopen(FLASH_HOST_CHECK_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    const auto create =
        reinterpret_cast<CreateFlashDevice2Function>(dlsym(library, "CreateFlashDevice2"));
    CheckedHost host;
    IFlashDevice2* device = nullptr;
    for (const char* const told :
         {create("", "", "", nullptr, &device), create("", "", "", &host, nullptr)})
        EXPECT_STREQ(told,
                     "CreateFlashDevice2: expected a host and a place for the device; came null");
    dlclose(library);
}

TEST(HostCheck, TellsWhatItIsAndPublishesTheDevice) {
    CheckedHost host;
    host.Faults([](IFlashDevice2& d) {
        bool available = false;
        const char* names = "";
        EXPECT_EQ(d.Initialize(&available, &names), nullptr);
        EXPECT_TRUE(available);
        EXPECT_STREQ(names, "CheckProgress | CheckLoader | CheckShownError | CheckReturnedError");
        return static_cast<const char*>(nullptr);
    });
    EXPECT_EQ(host.settings["DeviceInfoFlashSize"] + host.settings["DeviceInfoFamily"] +
                  host.settings["FlashChecksumValue"],
              "64KBHost check--");
}

}  // namespace

}  // namespace test
