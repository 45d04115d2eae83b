#include "hostcheck/Loader.h"

#include <algorithm>
#include <array>
#include <chrono>
#include <cstring>
#include <span>
#include <thread>

#include "device/SettingKeys.h"
#include "plugin/Conversions.h"

namespace hostcheck {

namespace {

constexpr char kLoaderFile[] = "FlashLoaderMerrow.out";
constexpr char kLoaderSubdirectory[] = R"(..\..\merrow\)";

constexpr unsigned kBlocks[] = {0, 1};
constexpr auto kPollInterval = std::chrono::milliseconds(100);
constexpr int kUsualSeconds = 5;
constexpr int kMostSeconds = 30;

/// What one wait may take: the setting for the waits of a whole section.
std::chrono::seconds TimeLimit(const CheckedHost& host) try {
    const int seconds = ParseDecimal(host.Get(Setting::FlashTimeoutValue).value_or(""));
    return std::chrono::seconds(std::clamp(seconds, 1, kMostSeconds));
} catch (const std::exception&) {
    return std::chrono::seconds(kUsualSeconds);
}

Bytes BytesOf(std::span<const std::uint32_t> words) {
    Bytes bytes(words.size_bytes());
    std::memcpy(bytes.data(), words.data(), bytes.size());
    return bytes;
}

/// Only what is seen to have arrived is handed over: a loader that is told to program leftovers
/// would harm the flash.
void RequireArrived(CheckedHost& host, std::uint32_t address, const Bytes& bytes) {
    host.Write(address, bytes, 1, host.page);
    if (host.Read(address, bytes.size(), 1, host.page) != bytes)
        throw Breach("other bytes at " + HexWord(address) + ", so no chunk is handed over");
}

}  // namespace

std::string LoaderDirectory(const CheckedHost& host) {
    const auto directory = host.AskForAWhile([](IFlashHost& h) { return h.GetDirectory(); });
    if (!directory) throw Breach("null");
    return *directory;
}

void LoadLoader(CheckedHost& host) {
    host.loader.loaded = host.loader.cleared = host.loader.runs = false;
    host.loader.turn = 0;
    std::string directory;
    try {
        directory = LoaderDirectory(host) + kLoaderSubdirectory;
    } catch (const Breach&) {
        throw NotChecked("there is no directory");
    }
    for (const unsigned block : kBlocks)
        host.WriteWord(LoaderStatus(block), LoaderMemory::ChunkPending);
    host.Do([&](IFlashHost& h) { return h.LoadProgram(kLoaderFile, "", directory.c_str()); });
    host.loader.loaded = true;
}

std::string ClearStatusWords(CheckedHost& host) {
    if (!host.loader.loaded) throw NotChecked("the loader isn't loaded");
    std::array<std::uint32_t, 2> words{};
    for (const unsigned block : kBlocks) {
        words[block] = host.ReadWord(LoaderStatus(block));
        if (words[block] != LoaderMemory::ChunkPending) continue;
        host.WriteWord(LoaderStatus(block), 0);
        if (IsPending(host, block)) throw Breach("0xFFFFFFFF, which a write doesn't change");
    }
    host.loader.cleared = true;
    const std::string seen = HexWord(words[0]) + " and " + HexWord(words[1]);
    for (const std::uint32_t word : words)
        if (word == LoaderMemory::ChunkPending) throw Breach(seen);
    return seen + " in them";
}

void RequireStartable(const CheckedHost& host) {
    if (!host.loader.loaded) throw NotChecked("the loader isn't loaded");
    if (!host.loader.cleared)
        throw NotChecked("a status word may say \"to do\", and the loader would program leftovers");
}

void StartLoader(CheckedHost& host) {
    RequireStartable(host);
    host.Run();
    host.loader.runs = true;
}

// A "to do" that was left, and could be taken away, was told of at the first start.
void RestartLoader(CheckedHost& host) {
    LoadLoader(host);
    try {
        ClearStatusWords(host);
    } catch (const Breach&) {
        if (!host.loader.cleared) throw;
    }
    StartLoader(host);
}

bool IsPending(const CheckedHost& host, unsigned block) {
    return host.ReadWord(LoaderStatus(block)) == LoaderMemory::ChunkPending;
}

unsigned HandOver(CheckedHost& host) {
    const unsigned block = host.loader.turn;
    const std::array<std::uint32_t, 3> words = {0, LoaderMemory::BufferSize,
                                                LoaderMemory::ChunkPending};
    RequireArrived(host, LoaderBuffer(block), Bytes(LoaderMemory::BufferSize, 0xFF));
    RequireArrived(host, LoaderParameters(block), BytesOf(std::span(words).first(2)));
    host.Write(LoaderParameters(block), BytesOf(words), 1, host.page);
    host.loader.turn ^= 1;
    return block;
}

void AwaitChunk(const CheckedHost& host, unsigned block) {
    const auto limit = TimeLimit(host);
    for (auto waited = std::chrono::milliseconds(0); IsPending(host, block);
         waited += kPollInterval) {
        if (waited >= limit)
            throw Breach("\"to do\" in block " + std::to_string(block) + " after " +
                         std::to_string(limit.count()) +
                         " s: the loader hangs or doesn't run, or the status comes from a cache");
        std::this_thread::sleep_for(kPollInterval);
    }
}

void RequireNothingRuns(CheckedHost& host) {
    const unsigned block = HandOver(host);
    std::this_thread::sleep_for(3 * kPollInterval);
    const bool taken = !IsPending(host, block);
    ForgetChunks(host);
    if (taken) throw Breach("a loader that took a chunk");
}

void ForgetChunks(const CheckedHost& host) {
    for (const unsigned block : kBlocks) {
        try {
            host.WriteWord(LoaderStatus(block), 0);
        } catch (const Breach&) {
            // The check that wrote there before says so.
        }
    }
}

}  // namespace hostcheck
