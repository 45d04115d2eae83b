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

using namespace std::chrono_literals;

/// Whoever looks more often keeps the probe busy and wins nothing.
constexpr std::chrono::milliseconds kShortestPause = 1ms;

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
    const Time until = Now() + plugin::kPollInterval;
    if (LooksStopIt() && chunkTime_) PauseFor(*chunks_[*block], Now(), until);
    Await(*block, until, [&] {
        look();
        std::uint32_t status = 0;
        std::memcpy(&status, buffer, sizeof status);
        return status == plugin::kStatusPending;
    });
}

void LoaderWait::Write(const void* buffer, std::size_t count, std::uint32_t address, int page,
                       std::size_t width) {
    Chunk* chunk = NoteHandOver(buffer, count * width, address);
    next_.Write(buffer, count, address, page, width);
    if (chunk == nullptr) return;
    chunk->arrived = true;
    chunk->start = Now();
    observer_.HandedOver(chunk->flash);
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
        return &chunks_[block].emplace(Chunk{flash, Now()});
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
    return chunks_[0]->start <= chunks_[1]->start ? 0 : 1;
}

/// Looks until the chunk isn't pending any more or the time is up; whether it is done.
bool LoaderWait::Await(std::size_t block, Time until, const std::function<bool()>& isPending) {
    for (const Time from = Now(); isPending();) {
        if (stop_() || Now() >= until) return false;
        PauseFor(*chunks_[block], from, until);
    }
    Finish(block);
    return true;
}

/// Until the chunk should be done, going by the last ones. When it isn't then, as much longer as is
/// short beside what it has taken.
void LoaderWait::PauseFor(Chunk& chunk, Time from, Time until) {
    const Time now = Now();
    const Time usual = chunkTime_.value_or(Time::zero());
    const Time due = chunkTime_ ? chunk.start + usual : from;
    const Time step = std::max((now - due) / 8, usual / (LooksStopIt() ? 8 : 32));
    const Time pause = due > now ? due - now : step;
    // Rounded down: a look too early costs less than a loader that has run out of work.
    const auto wait = std::chrono::floor<std::chrono::milliseconds>(std::min(pause, until - now));
    ++chunk.pauses;
    Pause(static_cast<std::uint32_t>(std::max(wait, kShortestPause).count()));
}

void LoaderWait::Finish(std::size_t block) {
    const Chunk chunk = *std::exchange(chunks_[block], std::nullopt);
    const Time now = Now();
    LearnFrom(chunk, now - chunk.start);
    if (auto& next = chunks_[block ^ 1]) next->start = std::max(next->start, now);
    if (chunk.arrived) observer_.Programmed(chunk.flash);
}

/// A chunk that was found done at the first look, or at the first one after a pause, may have been
/// done long before; the next one is looked at a little earlier.
void LoaderWait::LearnFrom(const Chunk& chunk, Time took) {
    if (chunk.pauses == 0)
        chunkTime_ = std::min(chunkTime_.value_or(took), took);
    else
        chunkTime_ = chunk.pauses == 1 ? took - took / 16 : took;
}

void LoaderWait::Forget() {
    chunks_ = {};
}

}  // namespace host
