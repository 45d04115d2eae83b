// Collecting, and programming what is collected in batches: each takes about as long as a debugger
// gladly waits for an answer.

#include "host/flashing/DebuggerLoad.h"

#include <fmt/format.h>

#include <algorithm>
#include <utility>

#include "host/base/Interrupt.h"
#include "host/base/Text.h"
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

// Debuggers give an answer up after 8 s and more.
constexpr std::chrono::duration<double> kBatchTime{2.5};
constexpr std::uint64_t kFirstBatchBytes = std::uint64_t{32} << 10;
constexpr std::uint64_t kBatchBytesMin = std::uint64_t{4} << 10;
constexpr std::uint64_t kBatchBytesMax = std::uint64_t{4} << 20;

constexpr char kOrigin[] = "the debugger";

std::string RangeOfBytes(std::uint32_t address, std::uint64_t sizeBytes) {
    return fmt::format("{} at {:#x}", CountText(sizeBytes, "byte"), address);
}

/// What the plug-in may do for a debugger, whatever the settings choose for "program".
LoadRequest Request(const SettingStore& settings, EraseChoice::Kind erase) {
    LoadRequest request = RequestedLoad(settings);
    request.erase = {erase};
    request.checks = {.blankCheck = false, .checksum = false, .compare = false};
    return request;
}

}  // namespace

DebuggerLoad::DebuggerLoad(OpenDevice open, ScratchMemory scratch, SettingStore settings)
    : open_(std::move(open)),
      scratch_(std::move(scratch)),
      chosen_(std::move(settings)),
      batchBytes_(kFirstBatchBytes) {
    try {
        Device().RequireFlash();
    } catch (const Failure& failure) {
        throw TargetError(failure.what());
    }
    flash_ = GeometryOf(device_->Info());
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

base::AddressRange DebuggerLoad::RangeOf(std::uint32_t sector) const {
    return SectorsCovering({sector, sector}, flash_);
}

void DebuggerLoad::RequireInFlash(std::uint32_t address, std::uint64_t sizeBytes) const {
    if (address + sizeBytes <= flash_.flashBytes) return;
    throw TargetError(fmt::format("{} don't lie in the flash, {}", RangeOfBytes(address, sizeBytes),
                                  SizeText(flash_.flashBytes)));
}

// --- Collecting

void DebuggerLoad::Erase(std::uint32_t address, std::uint32_t sizeBytes) {
    const std::uint32_t sector = flash_.sectorBytes;
    if (address % sector != 0 || sizeBytes % sector != 0)
        throw TargetError(fmt::format("erasing {}: whole sectors of {} are erased",
                                      RangeOfBytes(address, sizeBytes), SizeText(sector)));
    // The flash may end inside its last sector, which is erased whole.
    if (sizeBytes != 0) RequireInFlash(address, std::uint64_t{sizeBytes} - (sector - 1));
    Begin();
    const std::uint64_t end = std::uint64_t{address} + sizeBytes;
    base::AddressSet erased;
    for (std::uint64_t at = address; at < end; at += sector) {
        const auto first = static_cast<std::uint32_t>(at);
        collected_[first] = {};
        erased.Add(RangeOf(first));
    }
    if (!loose_.Empty()) loose_ = Without(loose_, erased);
}

/// The first erase, or write, of a load.
void DebuggerLoad::Begin() {
    failed_ = false;
    if (!collected_.empty() || !loose_.Empty() || totals_.sectors != 0) return;
    totals_ = {};
    report_.clear();
}

void DebuggerLoad::Write(std::uint32_t address, std::string_view bytes) {
    if (failed_) throw TargetError("the load has failed already");
    if (bytes.empty()) return;
    RequireInFlash(address, bytes.size());
    CheckWrite(address, bytes);
    Begin();
    for (std::size_t done = 0; done < bytes.size();) {
        const auto at = static_cast<std::uint32_t>(address + done);
        const base::AddressRange range = RangeOf(at);
        const std::size_t size = std::min<std::size_t>(bytes.size() - done, range.last - at + 1);
        const std::string_view part = bytes.substr(done, size);
        const auto found = collected_.find(range.first);
        if (found == collected_.end()) {
            loose_.Add(at, {part.begin(), part.end()}, kOrigin);
        } else {
            Sector& sector = found->second;
            if (sector.bytes.empty()) sector.bytes.resize(range.Size(), 0xFF);
            std::copy(part.begin(), part.end(), sector.bytes.begin() + (at - range.first));
            sector.written.Add({at, at + static_cast<std::uint32_t>(size - 1)});
            if (range.first != writing_ && collected_.contains(writing_))
                finishedBytes_ += collected_[writing_].written.Bytes();
            writing_ = range.first;
        }
        done += size;
    }
}

/// Throws for bytes that can't be what the flash holds in the end.
void DebuggerLoad::CheckWrite(std::uint32_t address, std::string_view bytes) {
    for (std::size_t done = 0; done < bytes.size();) {
        const auto at = static_cast<std::uint32_t>(address + done);
        const base::AddressRange range = RangeOf(at);
        const std::size_t size = std::min<std::size_t>(bytes.size() - done, range.last - at + 1);
        const auto found = collected_.find(range.first);
        if (found == collected_.end()) CheckNotErased(at, bytes.substr(done, size));
        done += size;
        if (found == collected_.end()) continue;
        for (const base::AddressRange& written : found->second.written.Ranges())
            for (std::uint64_t i = std::max(at, written.first);
                 i <= written.last && i < std::uint64_t{at} + size; ++i)
                if (found->second.bytes[i - range.first] !=
                    static_cast<std::uint8_t>(bytes[i - address]))
                    throw TargetError(
                        fmt::format("writing {}: {:#x} was written before, with another value",
                                    RangeOfBytes(address, bytes.size()), i));
    }
}

void DebuggerLoad::CheckNotErased(std::uint32_t address, std::string_view bytes) try {
    const auto last = static_cast<std::uint32_t>(address + bytes.size() - 1);
    auto held = Device().ReadFlash({address, last});
    std::string over(held.begin(), held.end());
    Overlay(address, over);
    for (std::size_t i = 0; i < bytes.size(); ++i)
        if (over[i] != '\xFF' && over[i] != bytes[i])
            throw TargetError(fmt::format("writing {}: {:#x} isn't blank, and wasn't erased",
                                          RangeOfBytes(address, bytes.size()), address + i));
} catch (const Failure& failure) {
    Fail(failure.what());
}

bool DebuggerLoad::Touches(const base::AddressRange& range) const {
    if (range.first >= flash_.flashBytes) return false;
    const auto sector = collected_.lower_bound(RangeOf(range.first).first);
    if (sector != collected_.end() && sector->first <= range.last) return true;
    return std::ranges::any_of(loose_.Sections(), [&](const image::Section& section) {
        return section.address <= range.last && section.Last() >= range.first;
    });
}

void DebuggerLoad::Overlay(std::uint32_t address, std::string& bytes) const {
    const auto put = [&](std::uint32_t first, const std::vector<std::uint8_t>& over) {
        for (std::size_t i = first < address ? address - first : 0;
             i < over.size() && first + i - address < bytes.size(); ++i)
            bytes[first + i - address] = static_cast<char>(over[i]);
    };
    for (const image::Section& section : loose_.Sections())
        put(section.address, section.bytes);
    if (address >= flash_.flashBytes) return;
    const std::vector<std::uint8_t> blank(flash_.sectorBytes, 0xFF);
    for (auto sector = collected_.lower_bound(RangeOf(address).first);
         sector != collected_.end() && sector->first < address + std::uint64_t{bytes.size()};
         ++sector)
        put(sector->first, sector->second.bytes.empty() ? blank : sector->second.bytes);
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
    collected_.clear();
    loose_ = {};
    finishedBytes_ = 0;
    totals_ = {};
    failed_ = true;
    report_ = fmt::format("The load failed: {}\n", text);
    throw TargetError(text);
}

void DebuggerLoad::Work(const target::gdb::InterruptCheck& stop) {
    Attempt(stop, [&] {
        Sectors ready;
        for (auto sector = collected_.begin(); sector != collected_.end();) {
            const auto next = std::next(sector);
            if (sector->first != writing_ && !sector->second.written.Empty())
                ready.insert(collected_.extract(sector));
            sector = next;
        }
        finishedBytes_ = 0;
        Program(std::move(ready), {});
    });
}

void DebuggerLoad::Done(const target::gdb::InterruptCheck& stop) {
    if (std::exchange(failed_, false)) throw TargetError("the load has failed");
    if (collected_.empty() && loose_.Empty() && totals_.sectors == 0) return;
    Attempt(stop, [&] {
        finishedBytes_ = 0;
        Program(std::exchange(collected_, {}), std::exchange(loose_, {}));
        device_.reset();
    });
    report_ = fmt::format(
        "The flash holds what the debugger has written, compared: {} in {}, {} of it left alone; "
        "{:.1f} s\n",
        SizeText(totals_.programmedBytes), CountText(totals_.sectors, "sector"),
        SizeText(totals_.unchangedBytes), totals_.time.count());
    totals_ = {};
}

void DebuggerLoad::Program(Sectors&& sectors, const image::Image& loose) {
    const auto start = Clock::now();
    FlashDevice& device = Device();
    image::Image written;
    image::Image contents = loose;
    base::AddressSet blank;
    for (auto& [first, sector] : sectors) {
        if (sector.written.Empty()) {
            blank.Add(RangeOf(first));
            continue;
        }
        for (const base::AddressRange& range : sector.written.Ranges())
            written.Add(range.first,
                        {sector.bytes.begin() + (range.first - first),
                         sector.bytes.begin() + (range.last - first) + 1},
                        kOrigin);
        contents.Add(first, std::move(sector.bytes), kOrigin);
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
    const Clock::duration took = Clock::now() - start;
    totals_.time += took;
    totals_.sectors += sectors.size() + (loose.Empty() ? 0 : 1);
    if (written.Empty()) return;
    const double rate =
        static_cast<double>(written.ByteCount()) / std::max(totals_.time.count(), 0.001);
    batchBytes_ = std::clamp(static_cast<std::uint64_t>(rate * kBatchTime.count()), kBatchBytesMin,
                             kBatchBytesMax);
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
    const bool begun = !collected_.empty() || !loose_.Empty() || totals_.sectors != 0;
    if (!begun) return "";
    const std::uint64_t left = collected_.size();
    std::string text = fmt::format(
        "the debugger left in the middle of a load: {} in {} were programmed and compared; {} more "
        "are as they were",
        SizeText(totals_.programmedBytes), CountText(totals_.sectors, "sector"),
        CountText(left, "sector"));
    collected_.clear();
    loose_ = {};
    totals_ = {};
    device_.reset();
    return text;
}

std::string DebuggerLoad::Report() const {
    return fmt::format("{} of flash in sectors of {}\n{}", SizeText(flash_.flashBytes),
                       SizeText(flash_.sectorBytes), report_);
}

}  // namespace host
