// The host check finds what a host does wrong: tables of hosts with one fault each, and the line
// that names it. It survives all of them, does no harm, and accuses nobody else.

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>

#include "tests/hostcheck/CheckedHosts.h"

namespace test {

namespace {

using std::string;

std::vector<FaultyHost> AllFaultyHosts() {
    std::vector<FaultyHost> all;
    for (const auto table : {FaultySettings(), FaultyMemory(), FaultyCores(), FaultyDisplays()})
        all.insert(all.end(), table.begin(), table.end());
    return all;
}

// Each rule has a host that breaks it and nothing before it: a rule that finds nothing would be
// none.
TEST(HostCheck, HasAHostForEachRuleAndFindsNothingInAGoodOne) {
    const std::vector<FaultyHost> all = AllFaultyHosts();
    CheckedHost good;
    EXPECT_EQ(good.Faults(), "");
    int rules = 0;
    for (const string& line : good.lines) {
        const size_t ok = line.find(": ok: ");
        if (ok == string::npos || line.starts_with("ResetSettings")) continue;
        ++rules;
        const string rule = line.substr(0, ok) + ": expected " +
                            line.substr(ok + 6, line.find(';', ok) - ok - 6) + "; came";
        EXPECT_TRUE(std::ranges::any_of(all, [&](const FaultyHost& row) {
            return string(row.found).starts_with(rule);
        })) << rule;
    }
    EXPECT_GT(rules, 60);
    EXPECT_EQ(std::memcmp(good.target.ram.data() + 0x1840, string(64, '\0').data(), 64), 0);
}

TEST(HostCheck, FindsTheFaultOfEachHost) {
    const std::vector<unsigned char> flash = CheckedHost().target.flash;
    for (const FaultyHost& row : AllFaultyHosts()) {
        CheckedHost host;
        row.spoil(host);
        const string found = string("error: ") + row.found;
        EXPECT_EQ(host.Faults().substr(0, found.size()), found);
        EXPECT_FALSE(host.displaysOpen > 0) << found;
        const bool harmless = found.find("the flash as it was") == string::npos;
        EXPECT_EQ(host.target.flash == flash, harmless) << found;
    }
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
constexpr struct {
    const char* told;  ///< among the lines; null for nothing special
    void (*change)(CheckedHost& host);
} kOtherGoodHosts[] = {
    {"FlashCrystalFreq is unknown", [](CheckedHost& h) { h.settings.erase("FlashCrystalFreq"); }},
    {nullptr,
     [](CheckedHost& h) {  // a store for 63 characters
         h.set = [set = h.set](const char* name, const char* value) {
             return std::max(strlen(name), strlen(value)) > 62 ? "no room" : set(name, value);
         };
     }},
    {nullptr,
     [](CheckedHost& h) {  // what is empty is not there
         h.get = [get = h.get](const char* name) {
             const char* const value = get(name);
             return value == nullptr || string(name).starts_with("DeviceInfo") ? nullptr : value;
         };
     }},
    {"Sleep: not checked: pauses that last as long as was asked; the setting HostSimulatesTime is "
     "1",
     [](CheckedHost& h) {
         h.settings["HostSimulatesTime"] = "1";
         Fail(h.sleep, nullptr);
     }},
    {"0x00000001 and 0x00000007 in them",
     [](CheckedHost& h) {
         h.load = [&h] {
             h.target.SetStatus(0, 1);
             h.target.SetStatus(1, 7);
             return nullptr;
         };
     }},
    {"not checked: 32752 bytes of flash in one call; it can't be read in small pieces: the error",
     [](CheckedHost& h) { h.target.flash.resize(16384); }},
    {"all of it is ff, so that parts in a wrong order wouldn't show",
     [](CheckedHost& h) { std::ranges::fill(h.target.flash, 0xFF); }},
    {"the sizes of the device make no sense either way",
     [](CheckedHost& h) { h.target.registers[0x400FDFC4] = 0; }},
    {"not checked: flash as it is now, not as it was read before; after a reset, no ROM",
     [](CheckedHost& h) {
         h.reset = [&h, reset = h.reset](bool flag) {
             const char* const error = reset(flag);
             h.target.romInFront = false;
             h.target.registers[0x400FE0F0] = 0;
             return error;
         };
     }},
    {"it reads 0x00030200",
     [](CheckedHost& h) {
         h.target.registers[0x400FE000] = 0x00030200;
         h.target.registers[0x400FE008] = 0x003F001F;
     }},
    {nullptr,
     [](CheckedHost& h) {  // reads of flash in whole pieces of its own
         h.Bend([](Transfer& t) {
             if (t.to != nullptr && t.width == 1) t.count = t.count > 128 ? t.count : 128;
         });
         h.target.flash.resize(33000);
     }},
    {nullptr, [](CheckedHost& h) { h.target.chunkTime = std::chrono::milliseconds(0); }},
    {"a loader that takes two chunks",
     [](CheckedHost& h) { h.target.chunkTime = std::chrono::milliseconds(400); }},
    {"it is \"..\\\"", [](CheckedHost& h) { Fail(h.directory, "..\\"); }},
};

TEST(HostCheck, AccusesNoOtherGoodHost) {
    for (const auto& [told, change] : kOtherGoodHosts) {
        CheckedHost host;
        change(host);
        EXPECT_EQ(host.Faults(), "") << (told ? told : "");
        EXPECT_TRUE(told == nullptr || host.Told(told)) << told;
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

const unsigned char kData[200] = {};

const char* Section(IFlashDevice2& d, uint64_t address, uint32_t length) {
    return d.WriteDataToFlash(kData, address, length, 1);
}

/// Calls of a host, and what is said of them.
const struct {
    const char* told;
    CheckedHost::Calls calls;
} kCalls[] = {
    {"", [](IFlashDevice2& d) { return d.PerformOperation("BlankCheck"); }},
    {"",
     [](IFlashDevice2& d) {
         for (const int mode : {0, 2, 1, 4}) {
             d.ResetSettings(mode);
             if (mode % 4 == 0) Section(d, 100, 100), Section(d, 0x10000 - 200, 200);
             if (mode == 4) d.ResetSettings(2);
         }
         return static_cast<const char*>(nullptr);
     }},
    {"error: WriteDataToFlash: expected ResetSettings(0) before the first section; came none\n",
     [](IFlashDevice2& d) { return Section(d, 0, 1); }},
    {"error: WriteDataToFlash: expected ResetSettings(0) before the first section; came none\n",
     [](IFlashDevice2& d) {
         d.ResetSettings(2);
         Section(d, 0, 1);
         return d.ResetSettings(2);
     }},
    {"error: WriteDataToFlash: expected ResetSettings(0) before the first section; came none\n",
     [](IFlashDevice2& d) {
         d.ResetSettings(1);
         return Section(d, 0, 1);
     }},
    {"error: ResetSettings: expected 2 after the last section; came 0\n",
     [](IFlashDevice2& d) {
         d.ResetSettings(0);
         Section(d, 0, 1);
         d.ResetSettings(0);
         Section(d, 200, 1);
         return d.ResetSettings(2);
     }},
    {"error: ResetSettings: expected 2 after the last section; came 1\n",
     [](IFlashDevice2& d) {
         d.ResetSettings(0);
         Section(d, 0, 1);
         return d.ResetSettings(1);
     }},
    {"error: ResetSettings: expected 2 after the last section; came 3\n",
     [](IFlashDevice2& d) {
         d.ResetSettings(4);
         Section(d, 0, 1);
         return d.ResetSettings(3);
     }},
    {"error: WriteDataToFlash: expected no section of length 0; came one\n",
     [](IFlashDevice2& d) {
         d.ResetSettings(0);
         return d.WriteDataToFlash(static_cast<const unsigned char*>(nullptr), 0, 0, 1);
     }},
    {"error: WriteDataToFlash: expected a section in the 64 KiB of flash that AddressWithinFlash "
     "tells of; came 2 bytes for 0x0000FFFF\n",
     [](IFlashDevice2& d) {
         d.ResetSettings(0);
         return Section(d, 0xFFFF, 2);
     }},
    {"error: WriteDataToFlash: expected a section in the 64 KiB of flash that AddressWithinFlash "
     "tells of; came 4294967295 bytes for 0x00010000\n",
     [](IFlashDevice2& d) {
         d.ResetSettings(0);
         return Section(d, 0x10000, 0xFFFFFFFF);
     }},
    {"error: WriteDataToFlash: expected as many bytes to read as length says; came fewer\n",
     [](IFlashDevice2& d) {
         d.ResetSettings(0);
         return d.WriteDataToFlash(static_cast<const unsigned char*>(nullptr), 0, 1, 1);
     }},
    {"returned: Address value is too big\n",
     [](IFlashDevice2& d) { return Section(d, 0x100000000, 1); }},
    {"returned: Unsupported target data type\n",
     [](IFlashDevice2& d) {
         return d.WriteDataToFlash(static_cast<const uint16_t*>(nullptr), 0, 1, 1);
     }},
    {"error: PerformOperation: expected a name from the list; came \"erase\"\n",
     [](IFlashDevice2& d) { return d.PerformOperation("erase"); }},
    {"returned: expected a text for operation; came none\n",
     [](IFlashDevice2& d) { return d.PerformOperation(kNoText); }},
    {"error: This error is shown, 100 % of it, %s and %d, and the operation has failed.\n",
     [](IFlashDevice2& d) { return d.PerformOperation("CheckShownError"); }},
    {"returned: This error is returned, 100 % of it, %s and %d.\n",
     [](IFlashDevice2& d) { return d.PerformOperation("CheckReturnedError"); }},
    {"returned: expected a pointer for within; came null\n",
     [](IFlashDevice2& d) { return d.AddressWithinFlash(0, nullptr); }},
    {"returned: expected a pointer for flashAvailable; came null\n",
     [](IFlashDevice2& d) {
         const char* names = nullptr;
         return d.Initialize(nullptr, &names);
     }},
};

TEST(HostCheck, LooksAtTheCallsOfTheHostToo) {
    for (const auto& [told, calls] : kCalls)
        EXPECT_EQ(CheckedHost().Faults(calls), told);
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
