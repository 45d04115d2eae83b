// Whether what goes into the loader's buffers arrives, and how fast.

#include <fmt/format.h>

#include <algorithm>
#include <chrono>

#include "base/Crc32.h"
#include "base/Hex.h"
#include "host/base/Errors.h"
#include "host/base/Interrupt.h"
#include "host/base/Text.h"
#include "host/checks/CheckTable.h"
#include "host/facts/FlashMemory.h"
#include "host/facts/LoaderMemory.h"

namespace host {

namespace {

constexpr std::uint32_t kMailboxEnd =
    plugin::kParameterBlocks[1] + (plugin::kParameterBlocks[1] - plugin::kParameterBlocks[0]);
constexpr std::uint32_t kGuardBytes = 8;

/// The buffers as they should be.
class Pattern {
  public:
    explicit Pattern(target::Target& target) : target_(target), expected_(kBytes) {
        target_.Read(expected_.data(), kBytes, kFirst, plugin::kRamPage, 1);
    }

    /// Writes so many bytes behind the guard, which differ from those of any other size and are of
    /// all values, those that packets escape included. Reads them with the guards around them.
    void Try(std::uint32_t size) {
        const std::uint32_t offset = kGuardBytes + size % 4;
        for (std::uint32_t i = 0; i < size; ++i)
            expected_[offset + i] = static_cast<std::uint8_t>(31 * size + 7 * i + i / 256);
        target_.Write(&expected_[offset], size, kFirst + offset, plugin::kRamPage, 1);
        const std::uint32_t first = offset - kGuardBytes;
        std::vector<std::uint8_t> held(size + 2 * kGuardBytes);
        target_.Read(held.data(), held.size(), kFirst + first, plugin::kRamPage, 1);
        const auto [there, wanted] =
            std::mismatch(held.begin(), held.end(), expected_.begin() + first);
        if (there != held.end())
            throw CheckFailed(fmt::format(
                "{} holds {:#04x}, not {:#04x}, after {} were written at {}",
                base::HexText(kFirst + first + static_cast<std::uint32_t>(there - held.begin())),
                *there, *wanted, CountText(size, "byte"), base::HexText(kFirst + offset)));
    }

  private:
    static constexpr std::uint32_t kFirst = plugin::kLoaderBuffers;
    static constexpr std::uint32_t kBytes = plugin::kParameterBlocks[0] - plugin::kLoaderBuffers;

    target::Target& target_;
    std::vector<std::uint8_t> expected_;
};

/// All small ones, and those around each number of the loader's blocks.
std::vector<std::uint32_t> Sizes() {
    constexpr std::uint32_t kSmall = 64;
    std::vector<std::uint32_t> sizes;
    for (std::uint32_t size = 1; size <= kSmall; ++size)
        sizes.push_back(size);
    for (std::uint32_t size = plugin::kBlockBytes; size <= plugin::kChunkBytes;
         size += plugin::kBlockBytes)
        for (const std::uint32_t near : {size - 1, size, size + 1})
            if (near <= plugin::kChunkBytes) sizes.push_back(near);
    return sizes;
}

/// The seconds that each of some accesses took.
template <typename Access>
std::vector<double> Timed(const target::Target& target, int times, const Access& access) {
    std::vector<double> seconds;
    for (int i = 0; i < times; ++i) {
        const auto start = target.Now();
        access();
        seconds.push_back(std::chrono::duration<double>(target.Now() - start).count());
    }
    return seconds;
}

Spread SpreadOf(std::vector<double> values) {
    std::ranges::sort(values);
    return {values.front(), values[values.size() / 2], values.back()};
}

Spread RatesOf(const std::vector<double>& seconds) {
    constexpr double kShortest = 1e-9;
    std::vector<double> rates;
    rates.reserve(seconds.size());
    for (const double one : seconds)
        rates.push_back(plugin::kChunkBytes / std::max(one, kShortest));
    return SpreadOf(rates);
}

std::string Shown(const Spread& spread, double unit, const char* name) {
    const double values[] = {spread.minimum / unit, spread.median / unit, spread.maximum / unit};
    const int decimals = spread.median / unit < 10 ? 2 : 0;
    return fmt::format("{:.{}f}, {:.{}f}, {:.{}f} {}", values[0], decimals, values[1], decimals,
                       values[2], decimals, name);
}

}  // namespace

std::string CheckMemory(CheckSubject& subject) {
    base::AddressSet ranges;
    ranges.Add({plugin::kLoaderBuffers, kMailboxEnd - 1});
    for (const base::AddressRange& range :
         subject.loader.value_or(std::vector<base::AddressRange>()))
        ranges.Add(range);
    subject.memory.emplace(subject.Target(), ranges);
    Pattern pattern(subject.Target());
    const std::vector<std::uint32_t> sizes = Sizes();
    for (const std::uint32_t size : sizes) {
        if (Interrupted()) throw Failure(ExitStatus::Interrupted, "interrupted");
        pattern.Try(size);
    }
    return fmt::format("1 to {} bytes, in {} sizes, written and read back", plugin::kChunkBytes,
                       sizes.size());
}

std::string CheckDelay(CheckSubject& subject) {
    constexpr int kTimes = 31;
    std::uint32_t word = 0;
    const Spread delay = SpreadOf(Timed(subject.Target(), kTimes, [&] {
        subject.Target().Read(&word, 1, plugin::kLoaderBuffers, plugin::kRamPage, sizeof word);
    }));
    subject.speed.delaySeconds = delay;
    std::string text = Shown(delay, 1e-3, "ms an access (least, middle, most)");
    constexpr double kSlowSeconds = 0.05;
    if (delay.median > kSlowSeconds) throw CheckNoted(text);
    return text;
}

std::string CheckRate(CheckSubject& subject) {
    if (!subject.memory) throw CheckNotMade("the RAM can't be read");
    constexpr int kTimes = 7;
    target::Target& target = subject.Target();
    std::vector<std::uint8_t> chunk(plugin::kChunkBytes);
    subject.speed.readBytesPerSecond = RatesOf(Timed(target, kTimes, [&] {
        target.Read(chunk.data(), chunk.size(), plugin::kLoaderBuffers, plugin::kRamPage, 1);
    }));
    subject.speed.writeBytesPerSecond = RatesOf(Timed(target, kTimes, [&] {
        target.Write(chunk.data(), chunk.size(), plugin::kLoaderBuffers, plugin::kRamPage, 1);
    }));
    return fmt::format("reading {}, writing {} (least, middle, most)",
                       Shown(*subject.speed.readBytesPerSecond, 1e3, "kB/s"),
                       Shown(*subject.speed.writeBytesPerSecond, 1e3, "kB/s"));
}

std::string CheckChecksum(CheckSubject& subject) {
    if (!subject.opened.Server())
        throw CheckNotMade("there is no server: the target is simulated in the tool");
    const auto told = subject.Target().Checksum(plugin::kLoaderBuffers, plugin::kChunkBytes);
    if (!told) throw CheckNoted("the server has no qCRC, or one that sums up wrongly");
    std::string bytes(plugin::kChunkBytes, '\0');
    subject.Target().Read(bytes.data(), bytes.size(), plugin::kLoaderBuffers, plugin::kRamPage, 1);
    const std::uint32_t sum = base::AddToCrc32(base::kCrc32Begin, bytes);
    if (*told != sum)
        throw CheckFailed(
            fmt::format("qCRC gives {:#010x} for bytes that sum up to {:#010x}", *told, sum));
    return "qCRC gives the sum of the bytes that are read";
}

}  // namespace host
