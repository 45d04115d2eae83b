// Hosts that don't do with the target's core, the loader and time what they are asked to do.

#include <algorithm>
#include <chrono>
#include <thread>

#include "tests/hostcheck/CheckedHosts.h"

namespace test {

namespace {

using H = CheckedHost;

Spoil SleepsInstead(uint32_t (*milliseconds)(uint32_t asked)) {
    return On(&H::sleep,
              [=](auto&, auto& sleep, uint32_t asked) { return sleep(milliseconds(asked)); });
}

/// Does that after the loader was started.
Spoil AfterRun(void (*action)(H& host)) {
    return On(&H::run, [=](H& h, auto& run) {
        const char* const error = run();
        action(h);
        return error;
    });
}

/// Fails the accesses to a status word that come between LoadProgram and RunTarget.
Spoil FailingStatus(bool read) {
    return On(&H::load, [read](H& h, auto&) {
        for (const unsigned block : {0U, 1U})
            h.target.SetStatus(block, 0xFFFFFFFF);
        Refused("no status",
                [=](const Transfer& t) { return t.address == 0x2000101C && t.Reads() == read; })(h);
        return nullptr;
    });
}

/// Halts like that, and really before the next loader is loaded.
Spoil HaltingLate(const char* (*halt)(H& host, const H::Slot& was)) {
    return [halt](H& host) {
        On(&H::halt, halt)(host);
        On(&H::load, [](H& h, auto& load) { return h.target.Halt(), load(); })(host);
    };
}

const FaultyHost kFaultyCores[] = {
    {"expected null for a target that is halted already; came the error text \"halted",
     On(&H::halt, [n = 0](auto&...) mutable { return n++ > 0 ? "halted" : nullptr; })},
    {"ResetTarget: expected null for either flag; came the error text \"100 % no\"",
     On(&H::reset, [](auto&, auto& reset, bool flag) { return reset(flag), "100 % no"; })},
    {"ResetTarget: expected null for either flag; came the error text \"no flag\"",
     On(&H::reset, [](auto&, auto& reset, bool flag) { return flag ? reset(flag) : "no flag"; })},
    {"that are reset; came 0x00004000, as it was written before, when the flag is false",
     On(&H::reset, [](H& h, auto& reset, bool flag) { return flag ? reset(flag) : h.halt(); })},
    // Lets run what was there, and the program in flash: in silence, or so that nothing is loaded.
    {"expected a loader that is stopped, with either flag; came a loader that took a",
     On(&H::reset,
        [](H& h, auto& reset, bool flag) {
            const char* const error = reset(flag);
            return h.target.Run(), error;
        })},
    {"expected a target that is left halted, so that RAM stays; came 00 00 00 00",
     On(&H::reset,
        [](H& h, auto& reset, bool flag) {
            On(&H::sleep, [](H& host, auto& sleep, uint32_t milliseconds) {
                std::fill_n(host.target.ram.begin() + 0x1100, 0x100, 0);
                return sleep(milliseconds);
            })(h);
            return reset(flag);
        })},
    {"is left halted, ready for LoadProgram; came the error text \"the target runs\"",
     [](H& host) {
         [[maybe_unused]] static bool runs = false;
         On(&H::reset, [](auto&, auto& reset, bool flag) {
             const char* const error = reset(flag);
             return runs = true, error;
         })(host);
         On(&H::halt, [](auto&, auto& halt) { return runs = false, halt(); })(host);
         On(&H::load, [](auto&, auto& load) { return runs ? "the target runs" : load(); })(host);
     }},
    {"Sleep: expected pauses that last as long as was asked; came 4.00 ms for 5",
     SleepsInstead([](uint32_t ms) { return ms - 2; })},
    {"Sleep: expected pauses that last as long as was asked; came 1.00 ms for 5",
     SleepsInstead([](uint32_t ms) { return ms / 10 * 10; })},
    {"Sleep: expected pauses that last as long as was asked; came 41.00 ms for 50",
     SleepsInstead([](uint32_t ms) { return std::min(ms, 40U); })},
    {"Sleep: expected pauses that don't last many times as long; came 201.00 ms for 20",
     SleepsInstead([](uint32_t ms) { return ms * 10; })},
    {"Sleep: expected pauses that don't last many times as long; came 2001.00 ms for 20",
     SleepsInstead([](uint32_t ms) { return ms * 100; })},
    {"expected a text that ends in a path separator; came a text that changed",
     On(&H::directory, [](auto&...) { return Dangling("/opt/"); })},
    {"do\" in the two status words, whatever RAM held; came 0x00000000 and 0xFFFFFFFF\n",
     On(&H::load, [](H& h, auto&) { return h.target.SetStatus(0, 0), nullptr; })},
    {"do\" in the two status words, whatever RAM held; came the error text \"no status\"",
     FailingStatus(true)},
    {"do\" in the two status words, whatever RAM held; came the error text \"no status\"",
     FailingStatus(false)},
    {"two status words, whatever RAM held; came 0xFFFFFFFF, which a write doesn't change",
     [](H& host) {
         Fail(host.load, nullptr);
         Bent([n = 0](Transfer& t, auto&) mutable {
             if (t.address == 0x2000100C && t.Writes() && ++n > 1) t.count = 0;
         })(host);
     }},
    {"RunTarget: expected null for the loader, at once; came null after 3.0",
     AfterRun([](auto&) { std::this_thread::sleep_for(std::chrono::seconds(3)); })},
    // One step.
    {"expected a loader that takes the chunk in block 0; came \"to do\" in block 0 after",
     AfterRun([](H& h) { h.target.Halt(); })},
    {"expected a loader that takes the chunk in block 0; came other bytes at 0x20001004",
     Bent([](Transfer& t, auto&) {
         if (t.Writes() && t.address == 0x20001004) t.count = 4;
     })},
    // The loader starts anew after each chunk.
    {"expected a loader that takes the one in block 1 next; came \"to do\" in block 1",
     Bent([](Transfer& t, H& h) {
         if (t.Writes() && t.address == 0x20001014 && t.count == 12) h.target.Run();
     })},
    {"expected a loader that takes two chunks handed over at once; came \"to do\" in blo",
     Bent([n = 0](Transfer& t, H& h) mutable {
         if (t.Writes() && t.count == 12 && ++n == 4) h.target.Halt();
     })},
    {"expected a loader that takes the chunk in block 0; came \"to do\" in block 0 af",
     On(&H::sleep, [](H& h, auto& sleep, auto ms) { return h.target.Halt(), sleep(ms); })},
    {"expected a status of block 1 other than 0xFFFFFFFF while the loader runs; came",
     AfterRun([](H& h) { h.target.SetStatus(1, 0xFFFFFFFF); })},
    {"HaltTarget: expected a loader that is stopped; came a loader that took a chunk",
     HaltingLate([](H& h, auto&) {
         const char* const error = h.AwaitLoader();
         return h.loaderRuns = false, error;
     })},
    // Goes on after a halt.
    {"HaltTarget: expected a loader that is stopped; came a loader that took a chunk",
     HaltingLate([](H& h, auto& halt) {
         const bool ran = h.loaderRuns;
         const char* const error = halt();
         return h.target.running = ran, error;
     })},
    {"expected no halt before the loader has done its last chunk; came \"to do\", so",
     On(&H::halt, [](H& h, auto&) { return h.target.Halt(), h.loaderRuns = false, nullptr; })},
    {"expected no reset before the loader has done its last chunk; came \"to do\", so",
     On(&H::reset,
        [](H& h, auto&, bool) { return h.target.Reset(), h.loaderRuns = false, nullptr; })},
    {"expected no read of flash before the loader has done its last chunk; came \"to do",
     On(&H::move, [](H& h, auto&, auto& t) { return h.target.Move(t); })},
    {"ReadMemory: expected the flash as it was; came",
     AfterRun([](H& h) { h.target.flash[2047] ^= 1; })},
    {"expected RAM on the page given to WriteDataToFlash; came the error text \"no mem",
     Bent([](Transfer& t, H& h) {
         if (h.Told("null after a reset") && t.Writes() && t.count == 4) t.address = 0x10000000;
     })},
};

}  // namespace

std::span<const FaultyHost> FaultyCores() {
    return kFaultyCores;
}

}  // namespace test
