// Hosts that don't do with the target's core, the loader and time what they are asked to do.

#include <algorithm>
#include <chrono>
#include <stdexcept>
#include <thread>
#include <utility>

#include "tests/hostcheck/CheckedHosts.h"

namespace test {

namespace {

using std::string;

void SleepInstead(CheckedHost& host, uint32_t (*milliseconds)(uint32_t asked)) {
    host.sleep = [milliseconds, sleep = host.sleep](uint32_t asked) {
        return sleep(milliseconds(asked));
    };
}

/// Does that after the loader was started.
template <typename Action>
void AfterRun(CheckedHost& host, Action action) {
    host.run = [&host, action, run = host.run] {
        const char* const error = run();
        action(host);
        return error;
    };
}

/// Fails the accesses to a status word that come between LoadProgram and RunTarget.
void FailStatus(CheckedHost& host, bool read) {
    host.load = [&host, read] {
        for (const unsigned block : {0U, 1U})
            host.target.SetStatus(block, 0xFFFFFFFF);
        host.move = [read, move = host.move](const Transfer& t) {
            return t.address == 0x2000101C && (t.to != nullptr) == read ? "no status" : move(t);
        };
        return nullptr;
    };
}

/// Fails the halt after that line, once.
void FailHalt(CheckedHost& host, const char* line) {
    host.halt = [&host, line, halt = host.halt, failed = false]() mutable {
        return host.Told(line) && !std::exchange(failed, true) ? "no" : halt();
    };
}

const FaultyHost kFaultyCores[] = {
    {"HaltTarget: expected null; came the error text \"no\"",
     [](CheckedHost& h) { Fail(h.halt, "no"); }},
    {"HaltTarget: expected null for a target that is halted already; came the error text \"halted",
     [](CheckedHost& h) {
         h.halt = [halted = false]() mutable {
             return std::exchange(halted, true) ? "halted already" : nullptr;
         };
     }},
    {"ResetTarget: expected null for either flag; came the error text \"100 % no\"",
     [](CheckedHost& h) {
         h.reset = [reset = h.reset](bool flag) {
             reset(flag);
             return "100 % no";
         };
     }},
    {"ResetTarget: expected null for either flag; came the error text \"no flag\"",
     [](CheckedHost& h) {
         h.reset = [reset = h.reset](bool flag) { return flag ? reset(flag) : "no flag"; };
     }},
    {"ResetTarget: expected registers that are reset; came 0x00004000, as it was written before, "
     "when the flag is true",
     [](CheckedHost& h) { Fail(h.reset, nullptr); }},
    {"ResetTarget: expected registers that are reset; came 0x00004000, as it was written before, "
     "when the flag is false",
     [](CheckedHost& h) {
         h.reset = [&h, reset = h.reset](bool flag) { return flag ? reset(flag) : h.halt(); };
     }},
    {"ResetTarget: expected a loader that is stopped, with either flag; came a loader that took a",
     [](CheckedHost& h) {  // lets run what was there
         h.reset = [&h, reset = h.reset](bool flag) {
             const char* const error = reset(flag);
             h.target.Run();
             return error;
         };
     }},
    {"ResetTarget: expected a target that is left halted, so that RAM stays; came 00 00 00 00",
     [](CheckedHost& h) {  // lets the program in flash run
         h.reset = [&h, reset = h.reset](bool flag) {
             h.sleep = [&h, sleep = h.sleep](uint32_t milliseconds) {
                 for (size_t i = 0x1100; i < 0x1200; ++i)
                     h.target.ram[i] = 0;
                 return sleep(milliseconds);
             };
             return reset(flag);
         };
     }},
    {"ResetTarget: expected a target that is left halted, ready for LoadProgram; came the error "
     "text \"the target runs\"",
     [](CheckedHost& h) {
         // The program in flash runs.
         static bool runs = false;
         h.reset = [reset = h.reset](bool flag) {
             const char* const error = reset(flag);
             runs = true;
             return error;
         };
         h.halt = [halt = h.halt] {
             runs = false;
             return halt();
         };
         h.load = [load = h.load] { return runs ? "the target runs" : load(); };
     }},
    {"Sleep: expected pauses that last as long as was asked; came 1.00 ms for 5",
     [](CheckedHost& h) { Fail(h.sleep, nullptr); }},
    {"Sleep: expected pauses that last as long as was asked; came 4.00 ms for 5",
     [](CheckedHost& h) { SleepInstead(h, [](uint32_t ms) { return ms - 2; }); }},
    {"Sleep: expected pauses that last as long as was asked; came 1.00 ms for 5",
     [](CheckedHost& h) { SleepInstead(h, [](uint32_t ms) { return ms / 10 * 10; }); }},
    {"Sleep: expected pauses that last as long as was asked; came 41.00 ms for 50",
     [](CheckedHost& h) { SleepInstead(h, [](uint32_t ms) { return std::min(ms, 40U); }); }},
    {"Sleep: expected pauses that don't last many times as long; came 201.00 ms for 20",
     [](CheckedHost& h) { SleepInstead(h, [](uint32_t ms) { return ms * 10; }); }},
    {"Sleep: expected pauses that don't last many times as long; came 2001.00 ms for 20",
     [](CheckedHost& h) { SleepInstead(h, [](uint32_t ms) { return ms * 100; }); }},
    {"Sleep: expected pauses that last as long as was asked; came the error text \"no time\"",
     [](CheckedHost& h) { Fail(h.sleep, "no time"); }},
    {"HaltTarget: expected null after a reset; came the error text \"no\"",
     [](CheckedHost& h) { FailHalt(h, "a target that is left halted, so that RAM stays"); }},
    {"HaltTarget: expected null before the loader is loaded; came the error text \"no\"",
     [](CheckedHost& h) { FailHalt(h, "flash on the page given to WriteDataToFlash"); }},
    {"HaltTarget: expected null for a target that runs; came the error text \"no\"",
     [](CheckedHost& h) { FailHalt(h, "2048 bytes of RAM while the program runs"); }},
    {"GetDirectory: expected a text that ends in a path separator; came \"/opt\"",
     [](CheckedHost& h) { Fail(h.directory, "/opt"); }},
    {"GetDirectory: expected a text that ends in a path separator; came null",
     [](CheckedHost& h) { Fail(h.directory, nullptr); }},
    {"GetDirectory: expected a text that ends in a path separator; came a text that changed",
     [](CheckedHost& h) { h.directory = [] { return Dangling("/opt/"); }; }},
    {"LoadProgram: expected null for the loader; came the error text \"no file\"",
     [](CheckedHost& h) { Fail(h.load, "no file"); }},
    {"LoadProgram: expected no \"to do\" in the two status words, whatever RAM held; came "
     "0xFFFFFFFF and 0xFFFFFFFF\n",
     [](CheckedHost& h) { Fail(h.load, nullptr); }},
    {"LoadProgram: expected no \"to do\" in the two status words, whatever RAM held; came "
     "0x00000000 and 0xFFFFFFFF\n",
     [](CheckedHost& h) {
         h.load = [&h] {
             h.target.SetStatus(0, 0);
             return nullptr;
         };
     }},
    {"LoadProgram: expected no \"to do\" in the two status words, whatever RAM held; came the error"
     " text \"no status\"",
     [](CheckedHost& h) { FailStatus(h, true); }},
    {"LoadProgram: expected no \"to do\" in the two status words, whatever RAM held; came the error"
     " text \"no status\"",
     [](CheckedHost& h) { FailStatus(h, false); }},
    {"LoadProgram: expected no \"to do\" in the two status words, whatever RAM held; came "
     "0xFFFFFFFF, which a write doesn't change",
     [](CheckedHost& h) {
         Fail(h.load, nullptr);
         h.Bend([loads = 0](Transfer& t) mutable {
             if (t.address == 0x2000100C && t.to == nullptr && ++loads > 1) t.count = 0;
         });
     }},
    {"RunTarget: expected null for the loader, at once; came the error text \"no start\"",
     [](CheckedHost& h) { Fail(h.run, "no start"); }},
    {"RunTarget: expected null for the loader, at once; came null after 3.0",
     [](CheckedHost& h) {
         AfterRun(h, [](CheckedHost&) { std::this_thread::sleep_for(std::chrono::seconds(3)); });
     }},
    {"RunTarget: expected a loader that takes the chunk in block 0; came \"to do\" in block 0 "
     "after "
     "1 s: the loader hangs",
     [](CheckedHost& h) { Fail(h.run, nullptr); }},
    {"RunTarget: expected a loader that takes the chunk in block 0; came \"to do\" in block 0 "
     "after",
     [](CheckedHost& h) {  // one step
         AfterRun(h, [](CheckedHost& host) { host.target.Halt(); });
     }},
    {"RunTarget: expected a loader that takes the chunk in block 0; came other bytes at 0x20001004",
     [](CheckedHost& h) {
         h.Bend([](Transfer& t) {
             if (t.to == nullptr && t.address == 0x20001004) t.count = 4;
         });
     }},
    {"RunTarget: expected a loader that takes the one in block 1 next; came \"to do\" in block 1",
     [](CheckedHost& h) {
         h.Bend([&h](Transfer& t) {  // the loader starts anew after each chunk
             if (t.to == nullptr && t.address == 0x20001014 && t.count == 12) h.target.Run();
         });
     }},
    {"RunTarget: expected a loader that takes two chunks handed over at once; came \"to do\" in "
     "blo",
     [](CheckedHost& h) {
         h.Bend([&h, chunks = 0](Transfer& t) mutable {
             if (t.to == nullptr && t.count == 12 && ++chunks == 4) h.target.Halt();
         });
     }},
    {"RunTarget: expected a loader that takes the chunk in block 0; came \"to do\" in block 0 af",
     [](CheckedHost& h) {
         h.sleep = [&h, sleep = h.sleep](uint32_t milliseconds) {
             h.target.Halt();
             return sleep(milliseconds);
         };
     }},
    {"ReadMemory: expected a status of block 1 other than 0xFFFFFFFF while the loader runs; came",
     [](CheckedHost& h) {
         AfterRun(h, [](CheckedHost& host) { host.target.SetStatus(1, 0xFFFFFFFF); });
     }},
    {"HaltTarget: expected a loader that is stopped; came a loader that took a chunk",
     [](CheckedHost& h) {
         h.halt = [&h] {
             const char* const error = h.AwaitLoader();
             h.loaderRuns = false;
             return error;
         };
         h.load = [load = h.load, &h] {
             h.target.Halt();
             return load();
         };
     }},
    {"HaltTarget: expected a loader that is stopped; came a loader that took a chunk",
     [](CheckedHost& h) {  // goes on after a halt
         h.halt = [&h, halt = h.halt] {
             const bool ran = h.loaderRuns;
             const char* const error = halt();
             h.target.running = ran;
             return error;
         };
         h.load = [load = h.load, &h] {
             h.target.Halt();
             return load();
         };
     }},
    {"HaltTarget: expected no halt before the loader has done its last chunk; came \"to do\", so",
     [](CheckedHost& h) {
         h.halt = [&h] {
             h.target.Halt();
             h.loaderRuns = false;
             return nullptr;
         };
     }},
    {"HaltTarget: expected no halt before the loader has done its last chunk; came the error text",
     [](CheckedHost& h) { h.target.chunkTime = std::chrono::milliseconds(700); }},
    {"ResetTarget: expected no reset before the loader has done its last chunk; came \"to do\", so",
     [](CheckedHost& h) {
         h.reset = [&h](bool) {
             h.target.Reset();
             h.loaderRuns = false;
             return nullptr;
         };
     }},
    {"ReadMemory: expected no read of flash before the loader has done its last chunk; came \"to "
     "do",
     [](CheckedHost& h) { h.move = [&h](const Transfer& t) { return h.target.Move(t); }; }},
    {"ReadMemory: expected the flash as it was; came",
     [](CheckedHost& h) {
         AfterRun(h, [](CheckedHost& host) { host.target.flash[2047] ^= 1; });
         h.Bend([](Transfer&) {});
     }},
    {"WriteMemory: expected RAM on the page given to WriteDataToFlash; came the error text \"no "
     "mem",
     [](CheckedHost& h) {
         h.Bend([&h](Transfer& t) {
             if (h.Told("null after a reset") && t.to == nullptr && t.count == 4)
                 t.address = 0x10000000;
         });
     }},
};

}  // namespace

std::span<const FaultyHost> FaultyCores() {
    return kFaultyCores;
}

}  // namespace test
