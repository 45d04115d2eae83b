// When to look at the loader's status words, and what is known from them.

#include "host/targets/LoaderWait.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstring>
#include <utility>

#include "host/facts/FlashMemory.h"
#include "host/facts/LoaderMemory.h"

namespace host {

namespace {

/// Whoever looks at a bar that stands still for longer wonders.
constexpr std::chrono::seconds kPatience{3};

constexpr std::uint32_t StatusWord(std::size_t block) {
    return plugin::kParameterBlocks[block] + plugin::kStatusOffset;
}

/// What the plug-in writes to a parameter block to hand a chunk over.
struct HandOver {
    std::uint32_t flashAddress;
    std::uint32_t sizeBytes;
    std::uint32_t status;
};

}  // namespace

void LoaderWait::AwaitIdle() {
    while (const auto block = OlderBlock()) {
        std::uint32_t status = 0;
        const auto isPending = [&] {
            next_.Read(&status, 1, StatusWord(*block), plugin::kRamPage, sizeof status);
            return status == plugin::kStatusPending;
        };
        if (Await(*block, chunks_[*block]->start + limit_, isPending)) continue;
        const base::AddressRange flash = chunks_[*block]->flash;
        Forget();
        if (stop_()) return;
        pace_ = {};
        throw target::TargetError(fmt::format(
            "the loader hasn't finished the chunk for {} within {} s; allow it more "
            "time (FlashTimeoutValue), if the flash is that slow",
            RangeText(flash), std::chrono::floor<std::chrono::seconds>(limit_).count()));
    }
}

void LoaderWait::Read(void* buffer, std::size_t count, std::uint32_t address, int page,
                      std::size_t width) {
    if (address < plugin::kLoaderBuffers) AwaitIdle();
    const auto look = [&] { next_.Read(buffer, count, address, page, width); };
    const auto block = BlockAtWork(address, count * width);
    if (!block) return look();
    Await(*block, RanFor() + plugin::kPollInterval, [&] {
        look();
        std::uint32_t status = 0;
        std::memcpy(&status, buffer, sizeof status);
        return status == plugin::kStatusPending;
    });
}

std::optional<std::uint32_t> LoaderWait::Checksum(std::uint32_t address, std::uint32_t sizeBytes) {
    AwaitIdle();
    return next_.Checksum(address, sizeBytes);
}

void LoaderWait::Write(const void* buffer, std::size_t count, std::uint32_t address, int page,
                       std::size_t width) {
    Chunk* chunk = NoteHandOver(buffer, count * width, address);
    next_.Write(buffer, count, address, page, width);
    if (chunk != nullptr) HandedOver(*chunk);
}

void LoaderWait::HandedOver(Chunk& chunk) {
    chunk.arrived = true;
    chunk.start = RanFor();
    if (chunk.number == 1) chunk.begun = chunk.start;
    observer_.HandedOver(chunk.flash);
}

LoaderWait::Chunk* LoaderWait::NoteHandOver(const void* buffer, std::size_t bytes,
                                            std::uint32_t address) {
    HandOver words{};
    if (!loaderRuns_ || bytes != sizeof words) return nullptr;
    std::memcpy(&words, buffer, sizeof words);
    for (std::size_t block = 0; block < chunks_.size(); ++block) {
        if (address != plugin::kParameterBlocks[block] + plugin::kChunkAddressOffset) continue;
        const base::AddressRange flash{words.flashAddress,
                                       words.flashAddress + words.sizeBytes - 1};
        observer_.HandingOver(flash);
        Chunk chunk{flash, RanFor(), RanFor()};
        if (const auto& before = chunks_[block ^ 1]) {
            chunk.begun = before->begun;
            chunk.number = before->number + 1;
        }
        return &chunks_[block].emplace(chunk);
    }
    return nullptr;
}

void LoaderWait::LoadProgram(const std::string& fileName, const std::string& directory) {
    AwaitIdle();
    next_.LoadProgram(fileName, directory);
    // RAM may hold "to do" from power-up or from the last load.
    constexpr std::uint32_t idle = 0;
    for (std::size_t block = 0; block < chunks_.size(); ++block)
        next_.Write(&idle, 1, StatusWord(block), plugin::kRamPage, sizeof idle);
    programLoaded_ = true;
}

void LoaderWait::Run() {
    next_.Run();
    loaderRuns_ = std::exchange(programLoaded_, false);
    toldOfWait_ = false;
}

void LoaderWait::Halt() {
    std::optional<target::TargetError> unfinished;
    try {
        AwaitIdle();
    } catch (const target::TargetError& error) {
        unfinished = error;
    }
    next_.Halt();
    Forget();
    loaderRuns_ = false;
    if (unfinished) throw target::TargetError(*unfinished);
}

void LoaderWait::Reset(bool flag) {
    AwaitIdle();
    next_.Reset(flag);
    programLoaded_ = loaderRuns_ = false;
}

std::optional<std::size_t> LoaderWait::BlockAtWork(std::uint32_t address, std::size_t bytes) const {
    for (std::size_t block = 0; block < chunks_.size(); ++block)
        if (chunks_[block] && address == StatusWord(block) && bytes == 4) return block;
    return std::nullopt;
}

std::optional<std::size_t> LoaderWait::OlderBlock() const {
    if (!chunks_[0] && !chunks_[1]) return std::nullopt;
    if (!chunks_[0] || !chunks_[1]) return chunks_[0] ? 0 : 1;
    return chunks_[0]->number < chunks_[1]->number ? 0 : 1;
}

/// Looks until the chunk isn't pending any more or the time is up; whether it is done.
bool LoaderWait::Await(std::size_t block, Time until, const std::function<bool()>& isPending) {
    for (;;) {
        const Time pause = StandsStill() ? Time::zero() : Due(block, until) - RanFor();
        if (pause > Time::zero() && !stop_()) Pause(pause);
        if (!Look(block, isPending)) break;
        TellOfLongWait(*chunks_[block]);
        if (stop_() || RanFor() >= until) return false;
    }
    Finish(block);
    return true;
}

void LoaderWait::TellOfLongWait(const Chunk& chunk) {
    if (toldOfWait_ || RanFor() - chunk.start < kPatience) return;
    toldOfWait_ = true;
    observer_.StillAtWork(chunk.flash, std::chrono::floor<std::chrono::seconds>(limit_));
}

/// When the next look should be sent off. A loader that has crashed is found out by a look.
LoaderWait::Time LoaderWait::Due(std::size_t block, Time until) const {
    until = std::min(until, RanFor() + plugin::kPollInterval);
    const Chunk& chunk = *chunks_[block];
    const Time due = chunk.begun + chunk.number * pace_.Guess();
    if (!StopsForReads()) return std::min(due, until) - pace_.LookTime();
    const auto& other = chunks_[block ^ 1];
    const Time both = due + pace_.Guess();
    return other && other->number > chunk.number && both <= until ? both : std::min(due, until);
}

bool LoaderWait::Look(std::size_t block, const std::function<bool()>& isPending) {
    const bool free = StandsStill();
    const Time stoppedAt = RanFor();
    const Time before = Now();
    const bool pending = isPending();
    if (!free) pace_.LookTook(Now() - before);
    Chunk& chunk = *chunks_[block];
    // A look that finds it pending has let it go on.
    const Time looked = free ? stoppedAt : RanFor();
    // Where nothing stops it, its begin is a guess, and one that is far too early would have it
    // slower than it is. It has certainly begun when the one before was seen done.
    const bool isFarGuess = chunk.start - chunk.begun > pace_.Guess() / 10;
    const Time begun =
        isFarGuess && !StopsForReads() && chunk.number == 1 ? chunk.start : chunk.begun;
    if (!pending || looked <= begun) return pending;
    chunk.atWork = looked;
    pace_.Pending((chunk.atWork - begun) / chunk.number);
    return true;
}

void LoaderWait::Finish(std::size_t block) {
    const Chunk chunk = *std::exchange(chunks_[block], std::nullopt);
    const Time now = RanFor();
    pace_.Done((now - chunk.begun) / chunk.number);
    if (auto& next = chunks_[block ^ 1]) BeginAfter(chunk, now, *next);
    if (chunk.arrived) observer_.Programmed(chunk.flash);
}

/// When the loader has begun the chunk after one that was seen to be done. Where looks stop it, the
/// two are timed together, unless this one was handed over since the loader ran last.
void LoaderWait::BeginAfter(const Chunk& chunk, Time seen, Chunk& next) const {
    const Time handedOver = std::exchange(next.start, std::max(next.start, seen));
    if (StopsForReads() && handedOver < seen) return;
    const Time done = chunk.begun + chunk.number * pace_.Guess();
    next.begun = std::max(handedOver, std::clamp(done, std::min(chunk.atWork, seen), seen));
    next.number = 1;
}

void LoaderWait::Forget() {
    chunks_ = {};
}

}  // namespace host
