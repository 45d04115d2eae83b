// LoaderWait: a target as the plug-in sees it, in front of the real one. The plug-in looks at the
// loader's status words once and then sleeps, and never looks after the last chunk; so the waiting
// is done here, where it costs no more than the loader needs.

#pragma once

#include <array>
#include <chrono>
#include <functional>
#include <optional>
#include <string>

#include "host/base/Interrupt.h"
#include "host/base/Text.h"
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

  protected:
    ~LoaderObserver() = default;
};

class LoaderWait final : public target::Target {
  public:
    using Time = std::chrono::nanoseconds;

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

    // These await the loader first. LoadProgram leaves 0 in both status words. Halt halts the
    // target even when the loader isn't done, and throws afterwards.
    void LoadProgram(const std::string& fileName, const std::string& directory) override;
    void Halt() override;
    void Reset(bool flag) override;

    void Run() override;
    Time Now() const override { return next_.Now(); }
    void Pause(std::uint32_t milliseconds) override { next_.Pause(milliseconds); }
    bool LooksStopIt() const override { return next_.LooksStopIt(); }
    bool SimulatesTime() const override { return next_.SimulatesTime(); }
    bool HidesFailedReads() const override { return next_.HidesFailedReads(); }

  private:
    struct Chunk {
        base::AddressRange flash;
        Time start;            ///< when the loader could begin it
        bool arrived = false;  ///< the write that hands it over was answered
        unsigned pauses = 0;   ///< made to wait for it
    };

    Chunk* NoteHandOver(const void* buffer, std::size_t bytes, std::uint32_t address);
    std::optional<std::size_t> BlockAtWork(std::uint32_t address, std::size_t bytes) const;
    std::optional<std::size_t> OlderBlock() const;
    bool Await(std::size_t block, Time until, const std::function<bool()>& isPending);
    void PauseFor(Chunk& chunk, Time from, Time until);
    void Finish(std::size_t block);
    void LearnFrom(const Chunk& chunk, Time took);
    void Forget();

    target::Target& next_;
    LoaderObserver& observer_;
    std::function<bool()> stop_;
    Time limit_ = std::chrono::seconds(30);
    bool programLoaded_ = false;
    bool loaderRuns_ = false;
    std::array<std::optional<Chunk>, 2> chunks_;  ///< at work, by their blocks
    std::optional<Time> chunkTime_;               ///< what the last ones took
};

}  // namespace host
