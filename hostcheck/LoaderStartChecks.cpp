// Loading and starting the loader, which finds nothing to do: once in each load, and in
// CheckLoader.

#include <chrono>

#include "hostcheck/Checks.h"
#include "hostcheck/Loader.h"
#include "hostcheck/Patterns.h"
#include "hostcheck/RomAlias.h"

namespace hostcheck {

namespace {

constexpr auto kAtOnce = std::chrono::seconds(1);

std::string HaltsForTheLoader(CheckedHost& host) {
    host.Halt();
    return "";
}

std::string DirectoryEndsInASeparator(CheckedHost& host) {
    const std::string directory = LoaderDirectory(host);
    if (!directory.ends_with('/') && !directory.ends_with('\\')) throw Breach(Quoted(directory));
    return "it is " + Quoted(directory);
}

std::string LoadsTheLoader(CheckedHost& host) {
    LoadLoader(host);
    return "";
}

std::string StartsTheLoader(CheckedHost& host) {
    RequireStartable(host);
    host.Announce(
        "RunTarget: called now. It has to return at once; if nothing follows, it doesn't.");
    const auto start = std::chrono::steady_clock::now();
    StartLoader(host);
    const std::chrono::duration<double> took = std::chrono::steady_clock::now() - start;
    if (took > kAtOnce) throw Breach("null after " + std::to_string(took.count()) + " s");
    return "";
}

void RequireRunning(const CheckedHost& host) {
    if (!host.loader.runs) throw NotChecked("the loader doesn't run");
}

std::string LoaderIsIdle(CheckedHost& host) {
    RequireRunning(host);
    const std::uint32_t status = host.ReadWord(LoaderStatus(1));
    if (status == LoaderMemory::ChunkPending) throw Breach(HexWord(status));
    return "it is " + HexWord(status);
}

// Buffers go to a target that runs. Nothing is handed over here, so any bytes will do.
std::string WritesWhileItRuns(CheckedHost& host) {
    RequireRunning(host);
    for (const unsigned salt : {0x17U, 0x71U}) {
        const Bytes bytes = Pattern(LoaderMemory::BufferSize, salt);
        host.Write(LoaderBuffer(0), bytes, 1, host.page);
        RequireEqual(host.Read(LoaderBuffer(0), bytes.size(), 1, host.page), bytes,
                     "written while the loader runs");
    }
    return "";
}

// Whoever looks at the flash afterwards finds it where it is when a load has ended.
std::string HaltsTheLoader(CheckedHost& host) {
    host.Halt();
    ForgetChunks(host);
    try {
        ClearRomAlias(host);
    } catch (const Breach&) {
        // That concerns other slots, which have been checked.
    }
    return "";
}

constexpr Check kLoaderStartChecks[] = {
    {Stage::LoaderStart, "HaltTarget", "null before the loader is loaded", HaltsForTheLoader},
    {Stage::LoaderStart, "GetDirectory", "a text that ends in a path separator",
     DirectoryEndsInASeparator},
    {Stage::LoaderStart, "LoadProgram", "null for the loader", LoadsTheLoader},
    {Stage::LoaderStart, "LoadProgram", "no \"to do\" in the two status words, whatever RAM held",
     ClearStatusWords},
    {Stage::LoaderStart, "RunTarget", "null for the loader, at once", StartsTheLoader},
    {Stage::LoaderStart, "ReadMemory",
     "a status of block 1 other than 0xFFFFFFFF while the loader runs", LoaderIsIdle},
    {Stage::LoaderStart, "WriteMemory", "2048 bytes of RAM while the program runs",
     WritesWhileItRuns},
    {Stage::LoaderEnd, "HaltTarget", "null for a target that runs", HaltsTheLoader},
};

}  // namespace

std::span<const Check> LoaderStartChecks() {
    return kLoaderStartChecks;
}

}  // namespace hostcheck
