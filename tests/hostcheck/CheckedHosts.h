// A host without fault, with a target behind it whose loader works on its own. Each slot is a
// function that a row of a table may replace, and so is what becomes of a memory access.

#pragma once

#include <chrono>
#include <cstdint>
#include <functional>
#include <map>
#include <span>
#include <string>
#include <vector>

#include "plugin/IFlashDevice2.h"
#include "tests/support/StrictHost.h"

namespace test {

struct Transfer {
    void* to;  ///< null for a write
    const void* from;
    size_t count;
    uint64_t address;
    size_t width;
    int16_t page = 1;

    bool Reads() const { return to != nullptr; }
    bool Writes() const { return to == nullptr; }
};

/// RAM, flash, registers, and a core that runs nothing but the loader.
struct PretendTarget {
    static constexpr uint32_t kRam = 0x20000000;

    std::vector<unsigned char> flash = std::vector<unsigned char>(32768);
    std::vector<unsigned char> ram = std::vector<unsigned char>(16384);
    std::map<uint64_t, uint32_t> registers = {{0x400FE000, 0x100A0000},  // Dorna
                                              {0x400FDFC0, 31},          // 64 KiB of flash
                                              {0x400FDFC4, 63}};         // 16 KiB of RAM
    bool running = false;
    bool romInFront = false;  ///< after a reset
    std::chrono::milliseconds chunkTime{30};

    PretendTarget();
    const char* Move(const Transfer& transfer);
    void Run();
    void Halt();
    void Reset();
    bool Pending(unsigned block) const;
    void SetStatus(unsigned block, uint32_t status);
    /// Does what the loader has got done by now.
    void Serve();

  private:
    unsigned turn_ = 0;
    std::chrono::nanoseconds begun_{-1};
};

class CheckedHost final : public StrictHost {
  public:
    using Slot = std::function<const char*()>;

    PretendTarget target;
    std::map<std::string, std::string> settings;
    std::vector<std::string> lines;  ///< what was shown and returned
    bool loaderRuns = false;
    bool errorsFail = false;
    int displaysOpen = 0;

    std::function<const char*(const char*)> get;
    std::function<const char*(const char*, const char*)> set;
    Slot load, run, halt, begin, update, end, directory;
    std::function<const char*(bool)> reset;
    std::function<const char*(Transfer)> move;
    std::function<const char*(const char*)> message = [](const char*) { return nullptr; };
    std::function<const char*(uint32_t)> sleep;

    CheckedHost();
    CheckedHost(const CheckedHost&) = delete;
    CheckedHost& operator=(const CheckedHost&) = delete;

    const char* GetProperty(const char* name) override { return get(name); }
    const char* SetProperty(const char* name, const char* value) override {
        return set(name, value);
    }
    const char* LoadProgram(const char*, const char*, const char*) override { return load(); }
    const char* RunTarget() override { return run(); }
    const char* HaltTarget() override { return halt(); }
    const char* ResetTarget(bool flag) override { return reset(flag); }
    const char* ReadMemory(void* buffer, size_t count, uint64_t address, int16_t page,
                           size_t width) override {
        return move({buffer, nullptr, count, address, width, page});
    }
    const char* WriteMemory(const void* buffer, size_t count, uint64_t address, int16_t page,
                            size_t width) override {
        return move({nullptr, buffer, count, address, width, page});
    }
    const char* BeginProgress(const char*) override { return begin(); }
    const char* UpdateProgress(uint32_t, const char*) override { return update(); }
    const char* EndProgress() override { return end(); }
    const char* ShowError(const char* text) override;
    const char* ShowMessage(const char* text) override;
    const char* GetDirectory() override { return directory(); }
    const char* Sleep(uint32_t milliseconds) override { return sleep(milliseconds); }

    /// Waits until the loader has done what it was given, for a second at most.
    const char* AwaitLoader();

    using Calls = std::function<const char*(IFlashDevice2&)>;

    /// A whole run, or CheckProgress and then other calls: the lines that tell of a failure.
    std::string Faults(const Calls& calls = {});

    /// The lines that begin so, with all others that were shown between.
    bool Told(const std::string& text) const;
};

/// What makes another host of a good one.
using Spoil = std::function<void(CheckedHost& host)>;

/// A fault of a host, and a part of the line that tells it, which is the first one of a failure.
struct FaultyHost {
    std::string found;
    Spoil spoil;
};

std::vector<FaultyHost> FaultyValues();
std::span<const FaultyHost> FaultySettings();
std::span<const FaultyHost> FaultyMemory();
std::span<const FaultyHost> FaultyCores();
std::span<const FaultyHost> FaultyDisplays();

/// A slot that always returns that text.
template <typename Slot>
void Fail(Slot& slot, const char* text) {
    slot = [text](auto&&...) { return text; };
}
template <typename Slot>
Spoil Failing(Slot CheckedHost::*slot, const char* text) {
    return [=](CheckedHost& host) { Fail(host.*slot, text); };
}

/// A slot that does something else: it gets the host, the slot as it was, and the arguments.
template <typename... Arguments, typename Work>
Spoil On(std::function<const char*(Arguments...)> CheckedHost::*slot, Work work) {
    return [=](CheckedHost& host) {
        host.*slot = [&host, was = host.*slot, work](Arguments... arguments) mutable {
            return static_cast<const char*>(work(host, was, arguments...));
        };
    };
}

/// Each access is changed before it is made.
template <typename Change>
Spoil Bent(Change change) {
    return On(&CheckedHost::move, [change](auto& host, auto& move, Transfer t) mutable {
        change(t, host);
        return move(t);
    });
}

/// Such accesses fail.
template <typename Such>
Spoil Refused(const char* text, Such such) {
    return On(&CheckedHost::move, [=](auto&, auto& move, const Transfer& t) mutable {
        return such(t) ? text : move(t);
    });
}

/// A text in memory that the host has given back: the next allocation overwrites it.
const char* Dangling(const std::string& text);

/// A pointer that is none: an error number, say.
inline const char* const kNoText = reinterpret_cast<const char*>(1);

}  // namespace test
