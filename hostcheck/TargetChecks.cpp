// The target's core and the passing of time: halt, reset, load and run the loader, wait.

#include <chrono>

#include "hostcheck/Checks.h"
#include "hostcheck/RamWindow.h"

namespace hostcheck {

namespace {

constexpr std::uint32_t kStatusWords[] = {0x2000100C, 0x2000101C};
constexpr std::uint8_t kToDo = 0xFF;  // in all four bytes
constexpr char kLoaderFile[] = "FlashLoaderMerrow.out";
constexpr char kLoaderSubdirectory[] = R"(..\..\merrow\)";

/// A host whose Sleep lets simulated time pass knows this setting, as "1".
constexpr char kSimulatesTime[] = "HostSimulatesTime";
constexpr std::uint32_t kPauseMs = 50;

std::string Halts(CheckedHost& host) {
    host.Halt();
    return "";
}

bool SimulatesTime(CheckedHost& host) {
    try {
        return host.Get(kSimulatesTime) == "1";
    } catch (const Breach&) {
        return false;
    }
}

std::string SleepsLongEnough(CheckedHost& host) {
    if (SimulatesTime(host))
        throw NotChecked(std::string("the setting ") + kSimulatesTime + " is 1");
    const auto start = std::chrono::steady_clock::now();
    host.Do([](IFlashHost& h) { return h.Sleep(kPauseMs); });
    const std::chrono::duration<double, std::milli> slept =
        std::chrono::steady_clock::now() - start;
    if (slept.count() < kPauseMs) throw Breach(std::to_string(slept.count()) + " ms");
    return "";
}

std::string Resets(CheckedHost& host) {
    for (const bool flag : {true, false})
        host.Do([flag](IFlashHost& h) { return h.ResetTarget(flag); });
    return "";
}

std::string ReachesRamOnThatPage(CheckedHost& host) {
    const RamWindow window(host, 16);
    const Bytes bytes{0xC0, 0x1D, 0xBE, 0xEF};
    host.Write(RamWindow::kStart, bytes, 1, host.page);
    if (host.Read(RamWindow::kStart, bytes.size(), 1, host.page) != bytes ||
        host.Read(RamWindow::kStart, bytes.size(), 1) != bytes)
        throw Breach("other bytes on page " + std::to_string(host.page));
    return "";
}

std::string Directory(CheckedHost& host) {
    const auto directory = host.Ask([](IFlashHost& h) { return h.GetDirectory(); });
    if (!directory) throw Breach("null");
    return *directory;
}

std::string DirectoryEndsInASeparator(CheckedHost& host) {
    const std::string directory = Directory(host);
    if (!directory.ends_with('/') && !directory.ends_with('\\')) throw Breach(Quoted(directory));
    return "";
}

// RAM may hold "to do" from the last load, so here it does.
std::string LoadsTheLoader(CheckedHost& host) {
    std::string directory;
    try {
        directory = Directory(host) + kLoaderSubdirectory;
    } catch (const Breach&) {
        throw NotChecked("there is no directory");
    }
    for (const std::uint32_t word : kStatusWords)
        host.Write(word, Bytes(4, kToDo), 4);
    host.Do([&](IFlashHost& h) { return h.LoadProgram(kLoaderFile, "", directory.c_str()); });
    host.loaderLoaded = true;
    return "";
}

// A loader that starts with "to do" programs what nobody has handed over; this one doesn't.
std::string ClearsTheStatusWords(CheckedHost& host) {
    std::size_t left = 0;
    for (const std::uint32_t word : kStatusWords) {
        if (host.Read(word, 4, 4) != Bytes(4, kToDo)) continue;
        host.Write(word, Bytes(4), 4);
        ++left;
    }
    if (!host.loaderLoaded) throw NotChecked("the loader isn't loaded");
    if (left != 0) throw Breach("0xFFFFFFFF still in " + std::to_string(left) + " of them");
    return "";
}

std::string StartsTheLoader(CheckedHost& host) {
    if (!host.loaderLoaded) throw NotChecked("the loader isn't loaded");
    host.Do([](IFlashHost& h) { return h.RunTarget(); });
    host.loaderRuns = true;
    return "";
}

std::string LoaderIsIdle(CheckedHost& host) {
    if (!host.loaderRuns) throw NotChecked("the loader doesn't run");
    if (host.Read(kStatusWords[1], 4, 4) == Bytes(4, kToDo)) throw Breach("0xFFFFFFFF");
    return "";
}

constexpr Check kTargetChecks[] = {
    {Stage::Creation, "HaltTarget", "null", Halts},
    {Stage::Creation, "HaltTarget", "null for a target that is halted already", Halts},
    {Stage::Initialize, "Sleep", "a pause of at least 50 ms", SleepsLongEnough},
    {Stage::Load, "ResetTarget", "null for either flag", Resets},
    {Stage::Load, "HaltTarget", "null after a reset", Halts},
    {Stage::Load, "WriteMemory", "RAM on the page given to WriteDataToFlash", ReachesRamOnThatPage},
    {Stage::Load, "GetDirectory", "a text that ends in a path separator",
     DirectoryEndsInASeparator},
    {Stage::Load, "LoadProgram", "null for the loader", LoadsTheLoader},
    {Stage::Load, "LoadProgram", "0 in both status words, whatever RAM held", ClearsTheStatusWords},
    {Stage::Load, "RunTarget", "null for the loader", StartsTheLoader},
    {Stage::Load, "ReadMemory", "a status of block 1 other than 0xFFFFFFFF while the loader runs",
     LoaderIsIdle},
    {Stage::Load, "HaltTarget", "null for a target that runs", Halts},
};

}  // namespace

std::span<const Check> TargetChecks() {
    return kTargetChecks;
}

}  // namespace hostcheck
