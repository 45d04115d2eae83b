// Programming what is collected in batches: each takes about as long as a debugger
// gladly waits for an answer.

#include "host/flashing/DebuggerLoad.h"

#include <fmt/format.h>

#include <algorithm>
#include <utility>

#include "host/base/Interrupt.h"
#include "host/base/Text.h"
#include "host/facts/LoaderMemory.h"
#include "host/facts/Operations.h"
#include "host/flashing/Comparison.h"
#include "host/flashing/DeviceGeometry.h"
#include "host/flashing/Load.h"
#include "host/flashing/ProgramSettings.h"
#include "host/flashing/Unchanged.h"
#include "host/settings/RangeSettings.h"

namespace host {

namespace {

using target::TargetError;
using Clock = std::chrono::steady_clock;
using BatchTime = std::chrono::duration<double>;  ///< in seconds

// Debuggers give an answer up after 8 s and more. Each batch costs a reset and the start of the
// loader, so that a rest which isn't much larger than a batch is left to be done with the last
// answer.
constexpr BatchTime kBatchTime{3.5};
constexpr double kLargestRest = 1.2;
constexpr std::uint64_t kBatchBytesMin = std::uint64_t{4} << 10;
constexpr std::uint64_t kBatchBytesMax = std::uint64_t{4} << 20;

/// What the plug-in may do for a debugger, whatever the settings choose for "program".
LoadRequest Request(const SettingStore& settings, EraseChoice::Kind erase) {
    LoadRequest request = RequestedLoad(settings);
    request.erase = {erase};
    request.checks = {.blankCheck = false, .checksum = false, .compare = false};
    return request;
}

/// The time of a chunk, its erases included, where reading as much takes so long: a read and its
/// confirmation are two exchanges, a chunk 3.5 and a sector's erase 3, and flash has times of its
/// own.
BatchTime ChunkTime(BatchTime reading, std::uint32_t sectorBytes) {
    constexpr BatchTime kFlashTime{0.015};
    const double sectors = static_cast<double>(plugin::kChunkBytes) / sectorBytes;
    return 1.75 * reading + kFlashTime + sectors * (1.5 * reading + kFlashTime);
}

}  // namespace

DebuggerLoad::DebuggerLoad(OpenDevice open, ScratchMemory scratch, SettingStore settings)
    : open_(std::move(open)), scratch_(std::move(scratch)), chosen_(std::move(settings)) {
    try {
        Device().RequireFlash();
    } catch (const Failure& failure) {
        throw TargetError(failure.what());
    }
    flash_ = GeometryOf(device_->Info());
    collected_ = CollectedFlash(flash_);
}

FlashDevice& DebuggerLoad::Device() {
    if (!device_) {
        settings_ = chosen_;
        device_ = open_(settings_);
        device_->CompareBytes();  // a server may sum up by a program in the debugger's RAM
    }
    return *device_;
}

target::gdb::MemoryRegion DebuggerLoad::Flash() const {
    return {0, static_cast<std::uint32_t>(flash_.flashBytes), flash_.sectorBytes};
}

// --- Collecting

void DebuggerLoad::Erase(std::uint32_t address, std::uint32_t sizeBytes) {
    const bool begins = !HasBegun();
    collected_.Erase(address, sizeBytes);
    failed_ = false;
    if (begins) Begin();
}

void DebuggerLoad::Write(std::uint32_t address, std::string_view bytes) {
    if (failed_) throw TargetError("the load has failed already");
    if (bytes.empty()) return;
    const bool begins = !HasBegun();
    try {
        collected_.Write(address, bytes,
                         [this](const auto& range) { return Device().ReadFlash(range); });
    } catch (const Failure& failure) {
        Fail(failure.what());
    }
    if (begins) Begin();
}

bool DebuggerLoad::HasBegun() const {
    return !collected_.Empty() || totals_.sectors != 0;
}

void DebuggerLoad::Begin() {
    totals_ = {};
    report_.clear();
    if (batchBytes_ == 0) GuessBatch();
}

void DebuggerLoad::GuessBatch() {
    const std::uint64_t size = std::min<std::uint64_t>(plugin::kChunkBytes, flash_.flashBytes);
    const auto start = Clock::now();
    try {
        Device().ReadFlash({0, static_cast<std::uint32_t>(size - 1)});
    } catch (const Failure&) {
        // What fails is told when there is something to program.
    }
    SetBatch(plugin::kChunkBytes / ChunkTime(Clock::now() - start, flash_.sectorBytes).count());
}

/// For so many bytes a second.
void DebuggerLoad::SetBatch(double rate) {
    batchBytes_ = std::clamp(static_cast<std::uint64_t>(rate * kBatchTime.count()), kBatchBytesMin,
                             kBatchBytesMax);
}

// --- Programming

template <typename Action>
void DebuggerLoad::Attempt(const target::gdb::InterruptCheck& stop, Action&& action) {
    const InterruptSource source(stop);
    try {
        action();
    } catch (const DeviceFailure& failure) {
        Fail(failure.Remark());
    } catch (const Failure& failure) {
        if (device_) device_->LeaveHalted();
        Fail(failure.what());
    }
}

void DebuggerLoad::Fail(const std::string& text) {
    device_.reset();
    collected_ = CollectedFlash(flash_);
    totals_ = {};
    failed_ = true;
    report_ = fmt::format("The load failed: {}\n", text);
    throw TargetError(text);
}

bool DebuggerLoad::HasWork() const {
    const std::uint64_t left = collected_.SectorCount() * flash_.sectorBytes;
    return collected_.FinishedBytes() >= batchBytes_ &&
           static_cast<double>(left) > kLargestRest * static_cast<double>(batchBytes_);
}

void DebuggerLoad::Work(const target::gdb::InterruptCheck& stop) {
    Attempt(stop, [&] { Program(collected_.TakeFinished(), {}); });
}

void DebuggerLoad::Done(const target::gdb::InterruptCheck& stop) {
    if (std::exchange(failed_, false)) throw TargetError("the load has failed");
    if (!HasBegun()) return;
    Attempt(stop, [&] {
        Program(collected_.TakeSectors(), collected_.TakeLoose());
        device_.reset();
    });
    report_ = fmt::format(
        "The flash holds what the debugger has written, compared: {} in {}, {} of it left alone; "
        "{:.1f} s\n",
        SizeText(totals_.programmedBytes), CountText(totals_.sectors, "sector"),
        SizeText(totals_.unchangedBytes), totals_.time.count());
    totals_ = {};
}

void DebuggerLoad::Program(CollectedFlash::Sectors&& sectors, const image::Image& loose) {
    const auto start = Clock::now();
    const std::uint64_t changedBefore = totals_.programmedBytes - totals_.unchangedBytes;
    FlashDevice& device = Device();
    image::Image written;
    image::Image contents = loose;
    base::AddressSet blank;
    for (auto& [first, sector] : sectors) {
        if (sector.written.Empty()) {
            blank.Add(collected_.RangeOf(first));
            continue;
        }
        for (const base::AddressRange& range : sector.written.Ranges())
            written.Add(range.first,
                        {sector.bytes.begin() + (range.first - first),
                         sector.bytes.begin() + (range.last - first) + 1},
                        CollectedFlash::kOrigin);
        contents.Add(first, std::move(sector.bytes), CollectedFlash::kOrigin);
    }
    const auto load = [&](const image::Image& image, EraseChoice::Kind erase) {
        if (image.Empty()) return;
        const LoadPlan plan = PlanOnDevice(device, Request(chosen_, erase), image);
        RunLoad(device, plan, image);
        totals_.unchangedBytes += plan.unchangedBytes;
        totals_.programmedBytes += plan.imageBytes;
    };
    load(written, EraseChoice::Kind::Necessary);
    load(loose, EraseChoice::Kind::Nothing);
    EraseOnly(blank.Ranges());
    Compare(contents);
    const BatchTime took = Clock::now() - start;
    totals_.time += took;
    totals_.sectors += sectors.size() + (loose.Empty() ? 0 : 1);
    // What was left alone says nothing of the next batch.
    const std::uint64_t changed = totals_.programmedBytes - totals_.unchangedBytes - changedBefore;
    if (changed != 0 && changed >= written.ByteCount() / 2)
        SetBatch(static_cast<double>(changed) / std::max(took.count(), 0.001));
}

/// Sectors of which nothing was written.
void DebuggerLoad::EraseOnly(const std::vector<base::AddressRange>& runs) {
    for (const base::AddressRange& run : runs) {
        const auto blank = [&] {
            return CompareWithErased(*device_, device_->Meter(), {run}).Empty();
        };
        if (blank()) continue;
        SelectRange(settings_, kEraseKeys, run);
        device_->Meter().Expect(Phase::Erase, run.Size());
        device_->Perform(plugin::kErase, Verbosity::Verbose);
        if (!blank())
            throw Failure(
                ExitStatus::ContentsDiffer,
                fmt::format("the flash isn't blank after the erase of {}", RangeText(run)));
    }
}

void DebuggerLoad::Compare(const image::Image& contents) {
    const Differences differences = CompareWithFlash(*device_, device_->Meter(), contents);
    if (differences.Empty()) return;
    const DifferentRange& first = differences.ranges.front();
    throw Failure(ExitStatus::ContentsDiffer,
                  fmt::format("the flash differs from what the debugger has written: {} in {}, the "
                              "first at {:#x}: {:#04x}, not {:#04x}",
                              CountText(differences.byteCount, "byte"),
                              CountText(differences.rangeCount, "range"), first.range.first,
                              first.actual, first.expected));
}

// --- Telling

std::string DebuggerLoad::Abandon() {
    if (!HasBegun()) return "";
    std::string text = fmt::format(
        "the debugger left in the middle of a load: {} in {} were programmed and compared; {} more "
        "are as they were",
        SizeText(totals_.programmedBytes), CountText(totals_.sectors, "sector"),
        CountText(collected_.SectorCount(), "sector"));
    collected_ = CollectedFlash(flash_);
    totals_ = {};
    device_.reset();
    return text;
}

std::string DebuggerLoad::Report() const {
    return fmt::format("{} of flash in sectors of {}\n{}", SizeText(flash_.flashBytes),
                       SizeText(flash_.sectorBytes), report_);
}

}  // namespace host
