// The contents: a header, the device's definition as option text, the user registers, how often the
// pages were erased, the flash pages that aren't erased, and a checksum over all of it. Numbers are
// little-endian. Version 1 had no erase counts; it is still read.

#include "target/simulated/Contents.h"

#include <fmt/format.h>
#include <zlib.h>

#include <algorithm>
#include <array>
#include <span>
#include <utility>

#include "base/ByteOrder.h"
#include "target/simulated/Ram.h"

namespace target {

namespace {

using Bytes = std::span<const std::uint8_t>;

// Order of checks: magic, version, checksum over everything before it; then definition, and the
// rest against the device that it makes. Nothing is believed that a checked part doesn't bear out:
// whoever wrote the file may have meant harm. Timings and faults are never kept; they belong to a
// run.

constexpr std::array<std::uint8_t, 8> kMagic = {'C', 'O', 'R', 'V', 'S', 'I', 'M', '\n'};
constexpr std::uint32_t kVersion = 2;
constexpr std::uint32_t kVersionWithoutCounts = 1;

Bytes BytesOf(const std::string& text) {
    return {reinterpret_cast<const std::uint8_t*>(text.data()), text.size()};
}

std::uint32_t Checksum(Bytes bytes) {
    return static_cast<std::uint32_t>(crc32_z(0, bytes.data(), bytes.size()));
}

// Always little-endian, so that a file can go from one machine to another.
void AppendWord(std::string& text, std::uint32_t value) {
    std::array<std::uint8_t, 4> bytes{};
    base::StoreWord(bytes.data(), value);
    text.append(bytes.begin(), bytes.end());
}

/// Runs of pages that were erased equally often: how many runs, then first page, length and count.
void AppendEraseCounts(std::string& text, const FlashArray& flash) {
    std::string runs;
    for (std::size_t first = 0, next = 0; first < flash.PageCount(); first = next) {
        const std::uint32_t count = flash.EraseCount(first);
        while (next < flash.PageCount() && flash.EraseCount(next) == count)
            ++next;
        if (count == 0) continue;
        AppendWord(runs, static_cast<std::uint32_t>(first));
        AppendWord(runs, static_cast<std::uint32_t>(next - first));
        AppendWord(runs, count);
    }
    AppendWord(text, static_cast<std::uint32_t>(runs.size() / 12));
    text += runs;
}

void AppendPages(std::string& text, const FlashArray& flash) {
    for (std::size_t i = 0; i < flash.PageCount(); ++i) {
        const FlashArray::Page* page = flash.ProgrammedPage(i);
        if (page == nullptr) continue;
        AppendWord(text, static_cast<std::uint32_t>(i));
        text.append(page->begin(), page->end());
    }
}

// Takes checked contents apart. What doesn't fit together is still refused: a checksum can be
// forged.
class Decoder {
  public:
    explicit Decoder(Bytes bytes) : rest_(bytes) {}

    void CheckFrame();
    DeviceOptions Definition();
    void Fill(SimulatedDevice& device);

  private:
    // Never beyond the end, however large a number in the file is.
    Bytes Take(std::size_t size) {
        if (size > rest_.size()) throw ContentsError("it ends too early");
        return std::exchange(rest_, rest_.subspan(size)).first(size);
    }
    std::uint32_t TakeWord() { return base::LoadWord(Take(4).data()); }

    void FillEraseCounts(FlashArray& flash);

    Bytes rest_;
    std::uint32_t version_ = 0;
};

void Decoder::CheckFrame() {
    const Bytes whole = rest_;
    if (rest_.size() < kMagic.size() || !std::equal(kMagic.begin(), kMagic.end(), rest_.begin())) {
        throw ContentsError("it holds no simulated device");
    }
    Take(kMagic.size());
    version_ = TakeWord();
    if (version_ != kVersion && version_ != kVersionWithoutCounts) {
        throw ContentsError(fmt::format("it has version {}, and this program reads {} and {}",
                                        version_, kVersionWithoutCounts, kVersion));
    }
    if (rest_.size() < 4) throw ContentsError("it ends too early");
    const std::size_t checkedSize = whole.size() - 4;
    if (Checksum(whole.first(checkedSize)) != base::LoadWord(whole.data() + checkedSize)) {
        throw ContentsError("its checksum is wrong, so it is damaged or cut short");
    }
    rest_ = rest_.first(rest_.size() - 4);
}

// What was given when the device was made is no demand of today's.
DeviceOptions Decoder::Definition() {
    const auto text = Take(TakeWord());
    try {
        DeviceOptions options = ParseDeviceOptions(std::string(text.begin(), text.end()));
        CheckDeviceOptions(options);
        options.given.clear();
        return options;
    } catch (const OptionError& error) {
        throw ContentsError(fmt::format("it holds a device unknown here ({})", error.what()));
    }
}

void Decoder::Fill(SimulatedDevice& device) {
    const std::uint32_t register0 = TakeWord();
    const std::uint32_t register1 = TakeWord();
    device.PresetCommittedUserRegisters({register0, register1});
    if (version_ != kVersionWithoutCounts) FillEraseCounts(device.Flash());
    // Erased pages aren't there. A page that comes twice takes its last contents.
    while (!rest_.empty()) {
        const std::uint32_t index = TakeWord();
        const auto page = Take(FlashArray::kPageSizeBytes);
        if (index >= device.Flash().PageCount()) throw ContentsError("it has too much flash");
        device.Flash().Preset(index * FlashArray::kPageSizeBytes, page);
    }
}

void Decoder::FillEraseCounts(FlashArray& flash) {
    std::uint64_t end = 0;
    for (std::uint32_t runs = TakeWord(); runs > 0; --runs) {
        const std::uint64_t first = TakeWord();
        const std::uint64_t length = TakeWord();
        const std::uint32_t count = TakeWord();
        // Each page once, or they could take for ever.
        if (first < end) throw ContentsError("it counts the erases of some flash twice");
        end = first + length;
        if (end > flash.PageCount()) throw ContentsError("it has too much flash");
        for (std::uint64_t page = first; page < end; ++page)
            flash.PresetEraseCount(page, count);
    }
}

}  // namespace

std::unique_ptr<SimulatedDevice> DecodeContents(const std::string& contents,
                                                const DeviceOptions& today, Clock* clock) {
    Decoder decoder(BytesOf(contents));
    decoder.CheckFrame();
    const DeviceOptions kept = decoder.Definition();
    auto device = std::make_unique<SimulatedDevice>(ReopenOptions(kept, today), clock);
    decoder.Fill(*device);
    return device;
}

std::string EncodeContents(const SimulatedDevice& device) {
    std::string contents(kMagic.begin(), kMagic.end());
    AppendWord(contents, kVersion);
    const std::string definition = DefinitionText(device.Options());
    AppendWord(contents, static_cast<std::uint32_t>(definition.size()));
    contents += definition;
    for (const std::uint32_t value : device.CommittedUserRegisters())
        AppendWord(contents, value);
    AppendEraseCounts(contents, device.Flash());
    AppendPages(contents, device.Flash());
    AppendWord(contents, Checksum(BytesOf(contents)));
    return contents;
}

}  // namespace target
