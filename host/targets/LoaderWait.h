// LoaderWait: a target as the plug-in sees it, in front of the real one. The plug-in looks at the
// loader's status words once and then sleeps, and never looks after the last chunk; so the waiting
// is done here, where it costs no more than the loader needs.
//
// All times are the loader's: how long the target has run. Where a look stops the target, the
// plug-in fills both buffers while it stands still, and the next look comes when both chunks should
// be done; elsewhere it comes for each chunk, in time for the next one to be handed over before the
// loader runs out of work.

#pragma once

#include <array>
#include <chrono>
#include <functional>
#include <optional>
#include <string>

#include "host/base/Interrupt.h"
#include "host/base/Text.h"
#include "host/targets/LoaderPace.h"
#include "target/Target.h"

namespace host {

/// Who wants to know what becomes of the chunks; they are given by their flash addresses.
class LoaderObserver {
  public:
    /// Before the write that hands a chunk over: one whose answer is lost may have arrived.
    virtual void HandingOver(const base::AddressRange& chunk) = 0;

    /// That write was answered.
    virtual void HandedOver(const base::AddressRange& chunk) = 0;

    /// The loader was seen to have finished the chunk.
    virtual void Programmed(const base::AddressRange& chunk) = 0;

    /// The loader has been at a chunk for some seconds; it is given up when it needs more than
    /// `limit`. Called once while a loader runs.
    virtual void StillAtWork(const base::AddressRange& /*chunk*/, std::chrono::seconds /*limit*/) {}

  protected:
    ~LoaderObserver() = default;
};

class LoaderWait final : public target::Target {
  public:
    using Time = LoaderPace::Time;

    /// Drives `next`; both must outlive it. A wait ends early when `stop` is true.
    LoaderWait(target::Target& next, LoaderObserver& observer,
               std::function<bool()> stop = Interrupted)
        : next_(next), observer_(observer), stop_(std::move(stop)) {}

    /// How long the loader may take for a chunk, from when it could begin, before AwaitIdle gives
    /// it up. 30 s to begin with.
    void SetLimit(Time limit) { limit_ = limit; }

    /// Waits until the loader has finished all that was handed over since it was started; returns
    /// at once when there is nothing. TargetError when a chunk isn't finished within the limit;
    /// nobody waits for it any more then.
    void AwaitIdle();

    /// A read of the status word of a chunk at work is answered when the chunk is done, or after
    /// the plug-in's poll interval as it is. A read of flash awaits the loader first.
    void Read(void* buffer, std::size_t count, std::uint32_t address, int page,
              std::size_t width) override;
    void Write(const void* buffer, std::size_t count, std::uint32_t address, int page,
               std::size_t width) override;

    std::optional<std::uint32_t> Checksum(std::uint32_t address, std::uint32_t sizeBytes) override;

    // These await the loader first. LoadProgram leaves 0 in both status words. Halt halts the
    // target even when the loader isn't done, and throws afterwards.
    void LoadProgram(const std::string& fileName, const std::string& directory) override;
    void Halt() override;
    void Reset(bool flag) override;

    void Run() override;
    Time Now() const override { return next_.Now(); }
    void Pause(Time time) override { next_.Pause(time); }
    bool StopsForReads() const override { return next_.StopsForReads(); }
    bool StandsStill() const override { return next_.StandsStill(); }
    Time RanFor() const override { return next_.RanFor(); }
    bool SimulatesTime() const override { return next_.SimulatesTime(); }
    bool HidesFailedReads() const override { return next_.HidesFailedReads(); }

  private:
    struct Chunk {
        base::AddressRange flash;
        Time start;            ///< when the loader could begin it, for all that is known
        Time begun;            ///< it, or the chunks before it that were at work then
        unsigned number = 1;   ///< among these
        Time atWork{0};        ///< when it was last seen to be
        bool arrived = false;  ///< the write that hands it over was answered
    };

    Chunk* NoteHandOver(const void* buffer, std::size_t bytes, std::uint32_t address);
    void HandedOver(Chunk& chunk);
    std::optional<std::size_t> BlockAtWork(std::uint32_t address, std::size_t bytes) const;
    std::optional<std::size_t> OlderBlock() const;
    bool Await(std::size_t block, Time until, const std::function<bool()>& isPending);
    Time Due(std::size_t block, Time until) const;
    bool Look(std::size_t block, const std::function<bool()>& isPending);
    void TellOfLongWait(const Chunk& chunk);
    void Finish(std::size_t block);
    void BeginAfter(const Chunk& chunk, Time seen, Chunk& next) const;
    void Forget();

    target::Target& next_;
    LoaderObserver& observer_;
    std::function<bool()> stop_;
    Time limit_ = std::chrono::seconds(30);
    bool programLoaded_ = false;
    bool loaderRuns_ = false;
    bool toldOfWait_ = false;
    std::array<std::optional<Chunk>, 2> chunks_;  ///< at work, by their blocks
    LoaderPace pace_;
};

}  // namespace host
