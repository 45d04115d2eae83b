// The loader at work: it takes its chunks in turn, and the host awaits the last one before it does
// anything that would stop it.

#include "hostcheck/Checks.h"
#include "hostcheck/Loader.h"
#include "hostcheck/Patterns.h"
#include "hostcheck/RomAlias.h"

namespace hostcheck {

namespace {

// What WriteDataToFlash sleeps behind the last chunk.
constexpr std::uint32_t kSettlingMs = 50;

Bytes ReadFlashStart(const CheckedHost& host) {
    ClearRomAlias(host);
    return host.Read(0, LoaderMemory::BufferSize, 1, kFlashPage);
}

std::string TakesAChunk(CheckedHost& host) {
    if (!host.loader.runs) throw NotChecked("the loader doesn't run");
    host.loader.flashBefore = ReadFlashStart(host);
    AwaitChunk(host, HandOver(host));
    return "";
}

std::string TakesBlocksInTurn(CheckedHost& host) {
    if (host.loader.turn != 1) throw NotChecked("the loader has taken no chunk");
    AwaitChunk(host, HandOver(host));
    host.loader.takesChunks = true;
    return "";
}

void RequireAtWork(const CheckedHost& host) {
    if (!host.loader.takesChunks) throw NotChecked("the loader takes no chunks");
}

// As in a load: one chunk on its way while the other is programmed, and a pause behind the last.
std::string TakesTwoAtOnce(CheckedHost& host) {
    RequireAtWork(host);
    for (int i = 0; i < 2; ++i) {
        const unsigned first = HandOver(host);
        const unsigned second = HandOver(host);
        host.Sleep(kSettlingMs);
        AwaitChunk(host, first);
        AwaitChunk(host, second);
    }
    return "";
}

std::string HaltStopsIt(CheckedHost& host) {
    RequireAtWork(host);
    host.Halt();
    RequireNothingRuns(host);
    return "";
}

/// Hands two chunks over and calls a slot that would stop the loader, or disturb it.
template <typename Slot>
void RequireAwaited(CheckedHost& host, Slot slot) {
    RequireAtWork(host);
    RestartLoader(host);
    HandOver(host);
    HandOver(host);
    slot();
    const bool lost = IsPending(host, 0) || IsPending(host, 1);
    host.Halt();
    ForgetChunks(host);
    if (lost) throw Breach("\"to do\", so that the last chunk would be lost");
}

std::string HaltAwaitsTheLoader(CheckedHost& host) {
    RequireAwaited(host, [&] {
        host.Announce(
            "HaltTarget: called now, with two chunks to do. If nothing follows, the host "
            "waits for ever.");
        host.Halt();
    });
    return "";
}

std::string ResetAwaitsTheLoader(CheckedHost& host) {
    RequireAwaited(host, [&] { host.Reset(true); });
    return "";
}

std::string FlashReadAwaitsTheLoader(CheckedHost& host) {
    RequireAwaited(host, [&] { host.Read(0, LoaderMemory::BufferSize, 1, kFlashPage); });
    return "";
}

std::string ResetStopsIt(CheckedHost& host) {
    RequireAtWork(host);
    for (const bool flag : {true, false}) {
        host.Halt();
        RestartLoader(host);
        host.Reset(flag);
        RequireNothingRuns(host);
    }
    return "";
}

// A target that runs takes no program.
std::string LoadsAfterAReset(CheckedHost& host) {
    RequireAtWork(host);
    for (const bool flag : {true, false}) {
        host.Reset(flag);
        RestartLoader(host);
    }
    AwaitChunk(host, HandOver(host));
    return "";
}

std::string FlashIsAsItWas(CheckedHost& host) {
    if (host.loader.flashBefore.empty()) throw NotChecked("nothing was handed over");
    host.Halt();
    RequireEqual(ReadFlashStart(host), host.loader.flashBefore, "after chunks of 0xFF");
    return "";
}

constexpr Check kLoaderWorkChecks[] = {
    {Stage::LoaderWork, "RunTarget", "a loader that takes the chunk in block 0", TakesAChunk},
    {Stage::LoaderWork, "RunTarget", "a loader that takes the one in block 1 next",
     TakesBlocksInTurn},
    {Stage::LoaderWork, "RunTarget", "a loader that takes two chunks handed over at once",
     TakesTwoAtOnce},
    {Stage::LoaderWork, "HaltTarget", "a loader that is stopped", HaltStopsIt},
    {Stage::LoaderWork, "HaltTarget", "no halt before the loader has done its last chunk",
     HaltAwaitsTheLoader},
    {Stage::LoaderWork, "ResetTarget", "no reset before the loader has done its last chunk",
     ResetAwaitsTheLoader},
    {Stage::LoaderWork, "ReadMemory", "no read of flash before the loader has done its last chunk",
     FlashReadAwaitsTheLoader},
    {Stage::LoaderWork, "ResetTarget", "a loader that is stopped, with either flag", ResetStopsIt},
    {Stage::LoaderWork, "ResetTarget", "a target that is left halted, ready for LoadProgram",
     LoadsAfterAReset},
    {Stage::LoaderWork, "ReadMemory", "the flash as it was", FlashIsAsItWas},
};

}  // namespace

std::span<const Check> LoaderWorkChecks() {
    return kLoaderWorkChecks;
}

}  // namespace hostcheck
