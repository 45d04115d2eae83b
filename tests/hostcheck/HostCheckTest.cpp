// The host check finds what a host does wrong: a table of hosts with one fault each, and the line
// that names it. It also survives all of them.

#include <dlfcn.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstring>
#include <functional>
#include <map>
#include <stdexcept>
#include <thread>
#include <vector>

#include "plugin/IFlashDevice2.h"
#include "tests/support/StrictHost.h"

namespace {

using std::string;

const char* const kNoText = reinterpret_cast<const char*>(1);  // an error number, say

struct Transfer {
    void* to;  ///< null for a write
    const void* from;
    size_t count;
    uint64_t address;
    size_t width;
    int16_t page = 1;
};

constexpr uint64_t kNowhere = 0x10000000;

/// A host without fault. Each slot is a function that a row of the table may replace.
class Host final : public test::StrictHost {
  public:
    std::map<string, string> settings = {{"FlashProgramOption", "Necessary Pages Only"},
                                         {"FlashProgramBlankCheckOption", "1"},
                                         {"FlashProgramCRCOption", "1"},
                                         {"FlashResetSetting", "0"},
                                         {"FlashTimeoutValue", "5"},
                                         {"FlashVerboseMode", "0"}};
    std::vector<unsigned char> flash = std::vector<unsigned char>(32768);
    std::vector<unsigned char> ram = std::vector<unsigned char>(16384);
    std::vector<string> lines;
    std::function<const char*(const char*)> get = [this](const char* name) {
        return settings.contains(name) ? settings[name].c_str() : nullptr;
    };
    std::function<const char*(const char*, const char*)> set = [this](const char* name,
                                                                      const char* value) {
        settings[name] = value;
        return nullptr;
    };
    std::function<const char*()> run, halt, begin, update, end = [] { return nullptr; };
    std::function<const char*()> load = [this] {
        for (const size_t status : {0x100Cu, 0x101Cu})
            std::fill_n(&ram[status], 4, 0);
        return nullptr;
    };
    std::function<const char*(bool)> reset = [](bool) { return nullptr; };
    std::function<void(Transfer&)> bend = [](Transfer&) {};  ///< what becomes of a memory access
    std::function<const char*(const char*)> message = [](const char*) { return nullptr; };
    std::function<const char*()> directory = [] { return "/"; };
    std::function<const char*(uint32_t)> sleep = [](uint32_t milliseconds) {
        std::this_thread::sleep_for(std::chrono::milliseconds(milliseconds));
        return nullptr;
    };
    bool errorsFail = false;

    const char* GetProperty(const char* name) override { return get(name); }
    const char* SetProperty(const char* name, const char* value) override {
        return set(name, value);
    }
    const char* LoadProgram(const char*, const char*, const char*) override { return Run(load); }
    const char* RunTarget() override { return Run(run); }
    const char* HaltTarget() override { return Run(halt); }
    const char* ResetTarget(bool flag) override { return reset(flag); }
    const char* ReadMemory(void* buffer, size_t count, uint64_t address, int16_t page,
                           size_t width) override {
        return Move({buffer, nullptr, count, address, width, page});
    }
    const char* WriteMemory(const void* buffer, size_t count, uint64_t address, int16_t page,
                            size_t width) override {
        return Move({nullptr, buffer, count, address, width, page});
    }
    const char* BeginProgress(const char*) override { return Run(begin); }
    const char* UpdateProgress(uint32_t, const char*) override { return Run(update); }
    const char* EndProgress() override { return Run(end); }
    const char* ShowError(const char* text) override {
        lines.push_back(string("error: ") + text);
        return errorsFail ? "no display" : nullptr;
    }
    const char* ShowMessage(const char* text) override {
        lines.emplace_back(text);
        return message(text);
    }
    const char* GetDirectory() override { return directory(); }
    const char* Sleep(uint32_t milliseconds) override { return sleep(milliseconds); }

    /// What the host was told to be wrong, and what calls returned, with a blank line between two.
    string Faults(const std::function<const char*(IFlashDevice2&)>& extra = {}) {
        void* library = dlopen(FLASH_HOST_CHECK_LIBRARY, RTLD_NOW | RTLD_LOCAL);
        const auto create =
            reinterpret_cast<CreateFlashDevice2Function>(dlsym(library, "CreateFlashDevice2"));
        IFlashDevice2* device = nullptr;
        bool flag = false;
        const char* names = nullptr;
        const unsigned char data = 0;
        Returned(create("", "", "", this, &device));
        Returned(device->Initialize(&flag, &names));
        Returned(device->PerformOperation("CheckProgress"));
        if (extra) {
            Returned(extra(*device));
        } else {
            Returned(device->ResetSettings(0));
            Returned(device->WriteDataToFlash(&data, 0, 1, 1));
        }
        device->Destroy();
        dlclose(library);
        string faults;
        for (const string& line : lines)
            if (line.starts_with("error: ") || line.starts_with("returned: "))
                faults += line + "\n";
        return faults;
    }

  private:
    const char* Move(Transfer t) {
        bend(t);
        if (t.address == 0x400FE000) t.address = 0x20000000;  // any word does for the register
        std::vector<unsigned char>& memory = t.address < 0x10000000 ? flash : ram;
        const uint64_t offset = t.address - (&memory == &ram ? 0x20000000 : 0);
        const size_t bytes = t.count * t.width;
        if (offset >= memory.size() || bytes > memory.size() - offset) return "no memory";
        if (t.to != nullptr)
            std::memcpy(t.to, &memory[offset], bytes);
        else
            std::memcpy(&memory[offset], t.from, bytes);
        return nullptr;
    }
    static const char* Run(const std::function<const char*()>& slot) {
        return slot ? slot() : nullptr;
    }
    void Returned(const char* text) {
        if (text != nullptr) lines.push_back(string("returned: ") + text);
    }
};

struct FaultyHost {
    const char* found;  ///< the first line that must be shown or returned
    void (*spoil)(Host& host);
};

template <typename Slot>
void Fail(Slot& slot, const char* text) {
    slot = [text](auto&&...) { return text; };
}

const FaultyHost kFaultyHosts[] = {
    {R"(GetProperty: expected null for a setting that the host hasn't; came "" for "FlashHost)",
     [](Host& h) {
         h.get = [get = h.get](const char* name) { return get(name) ? get(name) : ""; };
     }},
    {"GetProperty: expected keys told apart by upper and lower case; came \"0\"",
     [](Host& h) { h.settings["flashresetsetting"] = "0"; }},
    {"GetProperty: expected a value for each setting that a load needs; came null for FlashTimeout",
     [](Host& h) { h.settings.erase("FlashTimeoutValue"); }},
    {"GetProperty: expected values that the plug-in can read; came \"true\" for FlashResetSetting",
     [](Host& h) { h.settings["FlashResetSetting"] = "true"; }},
    {"GetProperty: expected values that the plug-in can read; came \"0x10\" for FlashTimeoutValue, "
     "which takes a whole decimal number of seconds, at least 1",
     [](Host& h) { h.settings["FlashTimeoutValue"] = "0x10"; }},
    {"GetProperty: expected values that the plug-in can read; came \"16 MHz\" for FlashCrystalFreq",
     [](Host& h) { h.settings["FlashCrystalFreq"] = "16 MHz"; }},
    {"GetProperty: expected values that the plug-in can read; came \"zz-zz-zz-zz-zz-zz\"",
     [](Host& h) { h.settings["FlashMACAddrInput"] = "zz-zz-zz-zz-zz-zz"; }},
    {R"(GetProperty: expected the same text when it is asked twice; came "3", then "4")",
     [](Host& h) {
         h.get = [&h, count = 0, get = h.get](const char* name) mutable {
             if (string(name) == "FlashTimeoutValue") h.settings[name] = std::to_string(++count);
             return get(name);
         };
     }},
    {"GetProperty: expected null for a setting that the host hasn't; came a pointer that leads to",
     [](Host& h) { Fail(h.get, kNoText); }},
    {"GetProperty: expected null for a setting that the host hasn't; came an exception: \"no key\"",
     [](Host& h) {
         h.get = [](const char*) -> const char* { throw std::out_of_range("no key"); };
     }},
    {R"(SetProperty: expected a copy of the value, which GetProperty returns; came "?" after "1")",
     [](Host& h) {
         h.get = [get = h.get](const char* name) {
             return string(name) == "FlashChecksumValue" ? "?" : get(name);
         };
     }},
    {"SetProperty: expected a value of 255 characters kept whole; came \"777",
     [](Host& h) {
         h.set = [&h](const char* name, const char* value) {
             h.settings[name] = string(value).substr(0, 100);
             return nullptr;
         };
     }},
    {"WriteMemory: expected the same bytes in all widths, in the order of the buffer; came 15 14",
     [](Host& h) {
         h.bend = [turned = string()](Transfer& t) mutable {
             if (t.to != nullptr || t.width == 1) return;
             turned.assign(static_cast<const char*>(t.from), t.count * t.width);
             for (size_t i = 0; i < turned.size(); i += t.width)
                 std::reverse(&turned[i], &turned[i] + t.width);
             t.from = turned.data();
         };
     }},
    {"WriteMemory: expected no change beside what is written; came",
     [](Host& h) {
         h.bend = [](Transfer& t) {
             static const unsigned char word[4] = {};
             if (t.to == nullptr && t.count * t.width <= 2) t = {t.to, word, 4, t.address & ~3u, 1};
         };
     }},
    {"WriteMemory: expected writes in the order of the calls; came",
     [](Host& h) { h.bend = [](Transfer& t) { t.count = t.address % 4 == 0 ? t.count : 0; }; }},
    {"WriteMemory: expected 2048 bytes in one call; came other bytes from offset 1024 on",
     [](Host& h) {
         h.bend = [](Transfer& t) { t.count = std::min<size_t>(t.count, t.to ? 4096 : 1024); };
     }},
    {"ReadMemory: expected the identification register at 0x400FE000; came bytes beside the buffer",
     [](Host& h) { h.bend = [](Transfer& t) { t.count += t.to != nullptr ? 1 : 0; }; }},
    {"ReadMemory: expected the identification register at 0x400FE000; came the error text \"no mem",
     [](Host& h) {
         h.halt = [&h] {
             h.bend = [](Transfer&) {};
             return nullptr;
         };
         h.bend = [](Transfer& t) { t.address = kNowhere; };
     }},
    {"ReadMemory: expected 2048 bytes of flash on page 0; came the error text \"no memory\"",
     [](Host& h) { h.bend = [](Transfer& t) { t.address = t.page ? t.address : kNowhere; }; }},
    {"ReadMemory: expected 32752 bytes of flash in one call; came a5 a5",
     [](Host& h) { h.bend = [](Transfer& t) { t.count = std::min<size_t>(t.count, 16384); }; }},
    {"ReadMemory: expected an error text at 0x10000000, where nothing is; came null",
     [](Host& h) {
         h.bend = [](Transfer& t) {
             if (t.address < 0x20000000) t = {t.to, t.from, 0, 0x20000000, 1};
         };
     }},
    {"WriteMemory: expected an error text at 0x10000000, where nothing is; came an exception",
     [](Host& h) {
         h.bend = [](Transfer& t) {
             if (t.to == nullptr && t.address < 0x20000000) throw 1;
         };
     }},
    {"HaltTarget: expected null for a target that is halted already; came the error text \"halted",
     [](Host& h) {
         h.halt = [halted = false]() mutable {
             return std::exchange(halted, true) ? "halted already" : nullptr;
         };
     }},
    {"ResetTarget: expected null for either flag; came the error text \"100 % no\"",
     [](Host& h) { Fail(h.reset, "100 % no"); }},
    {"Sleep: expected a pause of at least 50 ms; came 0.", [](Host& h) { Fail(h.sleep, nullptr); }},
    {R"(BeginProgress: expected null; came the error text "\xb5\x0a")",
     [](Host& h) { Fail(h.begin, "\xB5\n"); }},
    {"UpdateProgress: expected null for 0 to 100 percent; came an exception",
     [](Host& h) { h.update = []() -> const char* { throw 1; }; }},
    {"EndProgress: expected null; came the error text", [](Host& h) { Fail(h.end, "no"); }},
    {"ShowMessage: expected null for a text with percent signs and UTF-8; came the error text \"no",
     [](Host& h) {
         h.message = [](const char* text) { return strchr(text, '%') ? "no format" : nullptr; };
     }},
    {"ShowMessage: expected null for \"ReadMemory: ok: the identification",
     [](Host& h) {
         h.message = [](const char* text) -> const char* {
             if (strstr(text, "ok") != nullptr) throw 1;
             return nullptr;
         };
     }},
    {"GetDirectory: expected a text that ends in a path separator; came \"/opt\"",
     [](Host& h) { Fail(h.directory, "/opt"); }},
    {"GetDirectory: expected a text that ends in a path separator; came null",
     [](Host& h) { Fail(h.directory, nullptr); }},
    {"LoadProgram: expected null for the loader; came the error text \"no file\"",
     [](Host& h) { Fail(h.load, "no file"); }},
    {"LoadProgram: expected 0 in both status words, whatever RAM held; came 0xFFFFFFFF still in 2",
     [](Host& h) { h.load = nullptr; }},
    {"ReadMemory: expected a status of block 1 other than 0xFFFFFFFF while the loader runs; came",
     [](Host& h) {
         h.run = [&h] {
             std::fill_n(&h.ram[0x101C], 4, 0xFF);
             return nullptr;
         };
     }},
};

TEST(HostCheck, FindsTheFaultOfEachHostAndNothingInAGoodOne) {
    EXPECT_EQ(Host().Faults(), "");
    for (const FaultyHost& row : kFaultyHosts) {
        Host host;
        row.spoil(host);
        const string found = string("error: ") + row.found;
        EXPECT_EQ(host.Faults().substr(0, found.size()), found);
    }
}

TEST(HostCheck, ReturnsWhatTheHostCannotShow) {
    Host host;
    host.errorsFail = true;
    Fail(host.sleep, nullptr);
    EXPECT_NE(host.Faults().find("returned: ShowError: expected null for \"Sleep: "), string::npos);
}

TEST(HostCheck, LooksAtTheCallsOfTheHostToo) {
    const unsigned char data = 0;
    EXPECT_EQ(Host().Faults([&](IFlashDevice2& d) { return d.WriteDataToFlash(&data, 0, 1, 1); }),
              "error: WriteDataToFlash: expected ResetSettings before the first section; "
              "came none\n");
    EXPECT_NE(Host()
                  .Faults([none = static_cast<unsigned char*>(nullptr)](IFlashDevice2& d) {
                      return d.WriteDataToFlash(none, 0, 1, 1);
                  })
                  .find("expected as many bytes to read as length says"),
              string::npos);
    EXPECT_EQ(Host().Faults([](IFlashDevice2& d) { return d.PerformOperation("erase"); }),
              "error: PerformOperation: expected a name from the list; came \"erase\"\n");
    EXPECT_EQ(Host().Faults([](IFlashDevice2& d) { return d.AddressWithinFlash(0, nullptr); }),
              "returned: expected a pointer for within; came null\n");
    Host host;
    const string faults = host.Faults([&](IFlashDevice2& d) {
        host.begin = [&d] { return d.ResetSettings(0); };
        return d.PerformOperation("CheckProgress");
    });
    EXPECT_TRUE(faults.starts_with(
        "error: BeginProgress: expected null; came the error text \"called before"));
    EXPECT_NE(faults.find("expected no other call before this one has returned"), string::npos);
}

}  // namespace
