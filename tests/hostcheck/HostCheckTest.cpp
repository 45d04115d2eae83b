// The host check finds what a host does wrong: tables of hosts with one fault each, and the line
// that names it. It survives all of them, does no harm, and accuses nobody else.

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
    std::vector<FaultyHost> all;
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

/// Texts of settings that the plug-in takes, or that it takes for something else.
constexpr struct {
    const char* key;
    const char* text;
    bool good;
} kSettingTexts[] = {
    {"FlashResetSetting", "+1", true},
    {"FlashResetSetting", "001", true},
    {"FlashResetSetting", "true", false},
    {"FlashProgramCRCOption", "", false},
    {"FlashTimeoutValue", " 30 s", true},
    {"FlashTimeoutValue", "0x10", false},
    {"FlashTimeoutValue", "99999999999", false},
    {"FlashVerboseMode", "-1", true},
    {"FlashVerboseMode", "1.0", false},
    {"FlashEraseStartAddr", " 3ffff", true},
    {"FlashEraseStartAddr", "0X0003FFFF ", true},
    {"FlashEraseStartAddr", "", true},
    {"FlashEraseStartAddr", "0000000000000003ffff", true},
    {"FlashEraseStartAddr", "+10", true},
    {"FlashEraseStartAddr", "100000000", false},
    {"FlashEraseStartAddr", "$3ff", false},
    {"FlashEraseStartAddr", "0x", false},
    {"FlashEraseStartAddr", "3ff h", false},
    {"FlashCrystalFreq", "16 MHz", false},
    {"FlashCrystalFreq", "0", false},
    {"FlashCrystalFreq", "", false},
    {"FlashUserRegister1Commit", "yes", false},
    {"FlashMACAddrInput", "2-1b-c3-4-5-6", true},
    {"FlashMACAddrInput", "", true},
    {"FlashMACAddrInput", "02:1B:c3:04:05:06", true},
    {"FlashMACAddrInput", "zz-zz-zz-zz-zz-zz", false},
    {"FlashProgramOption", "Do Not Erase Flash Memory", true},
    {"FlashProgramOption", "Use the Erase Options Specified Below", true},
    {"FlashProgramOption", "necessary pages only", false},
    {"FlashEraseType", "By Address Range", true},
    {"FlashEraseType", "Entire flash", false},
};

TEST(HostCheck, JudgesTextsOfSettingsAsThePluginReadsThem) {
    for (const auto& [key, text, good] : kSettingTexts) {
        CheckedHost host;
        host.settings[key] = text;
        const string blamed =
            "error: GetProperty: expected values that the plug-in can read; came \"" +
            string(text) + "\" for " + key + ", which takes ";
        const string faults = host.Faults();
        EXPECT_EQ(good ? faults : faults.substr(0, blamed.size()), good ? "" : blamed) << text;
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

/// Calls of a host, and what is said of them.
constexpr struct {
    const char* told;
    const char* calls;
} kCalls[] = {
    {"", "perform BlankCheck"},
    {"",
     "reset 0; write 100 100; write 65336 200; reset 2; reset 1; reset 4; write 100 100; "
     "write 65336 200; reset 2"},
    {"error: WriteDataToFlash: expected ResetSettings(0) before the first section; came none\n",
     "write 0 1"},
    {"error: WriteDataToFlash: expected ResetSettings(0) before the first section; came none\n",
     "reset 2; write 0 1; reset 2"},
    {"error: WriteDataToFlash: expected ResetSettings(0) before the first section; came none\n",
     "reset 1; write 0 1"},
    {"error: ResetSettings: expected 2 after the last section; came 0\n",
     "reset 0; write 0 1; reset 0; write 200 1; reset 2"},
    {"error: ResetSettings: expected 2 after the last section; came 1\n",
     "reset 0; write 0 1; reset 1"},
    {"error: ResetSettings: expected 2 after the last section; came 3\n",
     "reset 4; write 0 1; reset 3"},
    {"error: WriteDataToFlash: expected no section of length 0; came one\n",
     "reset 0; write-nothing 0 0"},
    {"error: WriteDataToFlash: expected a section in the 64 KiB of flash that AddressWithinFlash "
     "tells of; came 2 bytes for 0x0000FFFF\n",
     "reset 0; write 65535 2"},
    {"error: WriteDataToFlash: expected a section in the 64 KiB of flash that AddressWithinFlash "
     "tells of; came 4294967295 bytes for 0x00010000\n",
     "reset 0; write 65536 4294967295"},
    {"error: WriteDataToFlash: expected as many bytes to read as length says; came fewer\n",
     "reset 0; write-nothing 0 1"},
    {"returned: Address value is too big\n", "write 4294967296 1"},
    {"returned: Unsupported target data type\n", "write-halfwords 0 1"},
    {"error: PerformOperation: expected a name from the list; came \"erase\"\n", "perform erase"},
    {"returned: expected a text for operation; came none\n", "perform-nothing"},
    {"error: This error is shown, 100 % of it, %s and %d, and the operation has failed.\n",
     "perform CheckShownError"},
    {"returned: This error is returned, 100 % of it, %s and %d.\n", "perform CheckReturnedError"},
    {"returned: expected a pointer for within; came null\n", "within-null"},
    {"returned: expected a pointer for flashAvailable; came null\n", "initialize-null"},
};

const char* Call(IFlashDevice2& device, const string& call) {
    static const unsigned char data[200] = {};
    std::istringstream words(call);
    string name;
    string operation;
    uint64_t first = 0;
    uint32_t length = 0;
    words >> name;
    if (name == "perform") return words >> operation, device.PerformOperation(operation.c_str());
    words >> first >> length;
    if (name == "reset") return device.ResetSettings(static_cast<int>(first));
    if (name == "write") return device.WriteDataToFlash(data, first, length, 1);
    if (name == "write-nothing")
        return device.WriteDataToFlash(static_cast<const unsigned char*>(nullptr), first, length,
                                       1);
    if (name == "write-halfwords")
        return device.WriteDataToFlash(static_cast<const uint16_t*>(nullptr), first, length, 1);
    if (name == "perform-nothing") return device.PerformOperation(kNoText);
    if (name == "within-null") return device.AddressWithinFlash(0, nullptr);
    const char* names = nullptr;
    return name == "initialize-null" ? device.Initialize(nullptr, &names) : "no such call";
}

TEST(HostCheck, LooksAtTheCallsOfTheHostToo) {
    for (const auto& row : kCalls) {
        const string faults = CheckedHost().Faults([&](IFlashDevice2& device) {
            const char* error = nullptr;
            for (const string& call : Split(row.calls, "; "))
                error = Call(device, call);
            return error;
        });
        EXPECT_EQ(faults, row.told);
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

// A device of 64 KiB, as the plug-in answers for one.
TEST(HostCheck, TellsWhatIsFlash) {
    CheckedHost host;
    host.Faults([](IFlashDevice2& d) {
        bool within = false;
        for (const auto& [address, expected] : {std::pair{0xFFFFU, true}, {0x10000U, false}}) {
            EXPECT_EQ(d.AddressWithinFlash(address, &within), nullptr);
            EXPECT_EQ(within, expected);
        }
        for (const auto& [size, expected] : {std::pair{1, true}, {2, false}, {-1, true}}) {
            d.AddressWithinFlash(0xFFFE, size, &within);
            EXPECT_EQ(within, expected);
        }
        d.AddressWithinFlash(0x10000, -1, &within);
        EXPECT_FALSE(within);
        within = true;
        EXPECT_EQ(d.AddressWithinSpecialRegion(0, &within), nullptr);
        EXPECT_FALSE(within);
        bool available = false;
        const char* names = "";
        EXPECT_EQ(d.Initialize(&available, &names), nullptr);
        EXPECT_TRUE(available);
        EXPECT_STREQ(names, "CheckProgress | CheckLoader | CheckShownError | CheckReturnedError");
        return static_cast<const char*>(nullptr);
    });
    EXPECT_EQ(host.settings["DeviceInfoFlashSize"], "64KB");
    EXPECT_EQ(host.settings["DeviceInfoFamily"], "Host check");
    EXPECT_EQ(host.settings["FlashChecksumValue"], "--");
}

}  // namespace

}  // namespace test
