// The contents file: a header, the device's definition as option text, the user registers, the
// flash pages that aren't erased, and a checksum over all of it. Numbers are little-endian.

#include "target/simulated/ContentsFile.h"

#include <fcntl.h>
#include <fmt/format.h>
#include <unistd.h>
#include <zlib.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <optional>
#include <span>
#include <system_error>
#include <utility>
#include <vector>

#include "target/simulated/Ram.h"

namespace target {

namespace {

using Bytes = std::vector<std::uint8_t>;

constexpr std::array<std::uint8_t, 8> kMagic = {'C', 'O', 'R', 'V', 'S', 'I', 'M', '\n'};
constexpr std::uint32_t kVersion = 1;

// A full 128 MiB flash with its page numbers, and room for the rest.
constexpr std::size_t kFileSizeMax = std::size_t{160} * 1024 * 1024;

constexpr char kWhatToDo[] = "name another file, or remove it to start with an erased device";

[[noreturn]] void ThrowUnusable(const std::string& path, const std::string& why) {
    throw ContentsError(
        fmt::format("The contents file {} can't be used: {}; {}.", path, why, kWhatToDo));
}

[[noreturn]] void ThrowSystemError(const char* doing, const std::string& path, int error) {
    throw ContentsError(
        fmt::format("{} the contents file {} failed: {}; check the path and its "
                    "permissions.",
                    doing, path, std::generic_category().message(error)));
}

class File {
  public:
    File(const std::string& path, int flags) : descriptor_(open(path.c_str(), flags, 0666)) {}
    ~File() { Close(); }
    File(const File&) = delete;
    File& operator=(const File&) = delete;

    bool IsOpen() const { return descriptor_ >= 0; }
    int Descriptor() const { return descriptor_; }
    int Close() { return IsOpen() ? close(std::exchange(descriptor_, -1)) : 0; }

  private:
    int descriptor_;
};

// Nothing when there is no such file.
std::optional<Bytes> ReadWhole(const std::string& path) {
    const File file(path, O_RDONLY | O_CLOEXEC);
    if (!file.IsOpen() && errno == ENOENT) return std::nullopt;
    if (!file.IsOpen()) ThrowSystemError("Opening", path, errno);
    Bytes bytes;
    std::size_t filled = 0;
    for (;;) {
        bytes.resize(std::max<std::size_t>(65536, filled * 2));
        const ssize_t got = read(file.Descriptor(), bytes.data() + filled, bytes.size() - filled);
        if (got < 0 && errno != EINTR) ThrowSystemError("Reading", path, errno);
        if (got == 0) break;
        filled += static_cast<std::size_t>(std::max<ssize_t>(got, 0));
        if (filled > kFileSizeMax) ThrowUnusable(path, "it is larger than any contents file");
    }
    bytes.resize(filled);
    return bytes;
}

void WriteAll(const File& file, std::span<const std::uint8_t> bytes, const std::string& path) {
    while (!bytes.empty()) {
        const ssize_t put = write(file.Descriptor(), bytes.data(), bytes.size());
        if (put < 0 && errno != EINTR) ThrowSystemError("Writing", path, errno);
        bytes = bytes.subspan(static_cast<std::size_t>(std::max<ssize_t>(put, 0)));
    }
}

// `path` is the file that the user knows of, for the error texts.
void WriteDurably(const std::string& temporary, std::span<const std::uint8_t> bytes,
                  const std::string& path) {
    File file(temporary, O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC);
    if (!file.IsOpen()) ThrowSystemError("Creating", path, errno);
    WriteAll(file, bytes, path);
    if (fsync(file.Descriptor()) != 0) ThrowSystemError("Writing", path, errno);
    if (file.Close() != 0) ThrowSystemError("Closing", path, errno);
}

// The rename itself lies in the directory. Where a directory can't be synced, the file is whole
// all the same, old or new; so that is no error.
void SyncDirectoryOf(const std::string& path) {
    const auto directory = std::filesystem::path(path).parent_path();
    const File file(directory.empty() ? "." : directory.string(), O_RDONLY | O_CLOEXEC);
    if (file.IsOpen()) fsync(file.Descriptor());
}

std::uint32_t Checksum(std::span<const std::uint8_t> bytes) {
    return static_cast<std::uint32_t>(crc32_z(0, bytes.data(), bytes.size()));
}

void AppendWord(Bytes& bytes, std::uint32_t value) {
    bytes.resize(bytes.size() + 4);
    StoreWord(bytes.data() + bytes.size() - 4, value);
}

void AppendPages(Bytes& bytes, const FlashArray& flash) {
    for (std::size_t i = 0; i < flash.PageCount(); ++i) {
        const FlashArray::Page* page = flash.ProgrammedPage(i);
        if (page == nullptr) continue;
        AppendWord(bytes, static_cast<std::uint32_t>(i));
        bytes.insert(bytes.end(), page->begin(), page->end());
    }
}

Bytes Encode(const SimulatedDevice& device) {
    Bytes bytes(kMagic.begin(), kMagic.end());
    AppendWord(bytes, kVersion);
    const std::string definition = DefinitionText(device.Options());
    AppendWord(bytes, static_cast<std::uint32_t>(definition.size()));
    bytes.insert(bytes.end(), definition.begin(), definition.end());
    for (const std::uint32_t value : device.CommittedUserRegisters())
        AppendWord(bytes, value);
    AppendPages(bytes, device.Flash());
    AppendWord(bytes, Checksum(bytes));
    return bytes;
}

// Takes a checked file apart. What doesn't fit together is still refused: a checksum can be forged.
class Decoder {
  public:
    Decoder(const std::string& path, std::span<const std::uint8_t> bytes)
        : path_(path), rest_(bytes) {}

    void CheckFrame();
    DeviceOptions Definition();
    void Fill(SimulatedDevice& device);

  private:
    std::span<const std::uint8_t> Take(std::size_t size) {
        if (size > rest_.size()) ThrowUnusable(path_, "it ends too early");
        return std::exchange(rest_, rest_.subspan(size)).first(size);
    }
    std::uint32_t TakeWord() { return LoadWord(Take(4).data()); }

    const std::string& path_;
    std::span<const std::uint8_t> rest_;
};

void Decoder::CheckFrame() {
    const std::span<const std::uint8_t> whole = rest_;
    if (rest_.size() < kMagic.size() || !std::equal(kMagic.begin(), kMagic.end(), rest_.begin())) {
        ThrowUnusable(path_, "it holds no simulated device");
    }
    Take(kMagic.size());
    const std::uint32_t version = TakeWord();
    if (version != kVersion) {
        ThrowUnusable(path_, fmt::format("it has version {}, and this program reads version {}",
                                         version, kVersion));
    }
    if (rest_.size() < 4) ThrowUnusable(path_, "it ends too early");
    const std::size_t checkedSize = whole.size() - 4;
    if (Checksum(whole.first(checkedSize)) != LoadWord(whole.data() + checkedSize)) {
        ThrowUnusable(path_, "its checksum is wrong, so it is damaged or cut short");
    }
    rest_ = rest_.first(rest_.size() - 4);
}

DeviceOptions Decoder::Definition() {
    const auto text = Take(TakeWord());
    try {
        DeviceOptions options = ParseDeviceOptions(std::string(text.begin(), text.end()));
        options.given.clear();
        return options;
    } catch (const OptionError& error) {
        ThrowUnusable(path_, fmt::format("it holds a device unknown here ({})", error.what()));
    }
}

void Decoder::Fill(SimulatedDevice& device) {
    const std::uint32_t register0 = TakeWord();
    const std::uint32_t register1 = TakeWord();
    device.PresetCommittedUserRegisters({register0, register1});
    while (!rest_.empty()) {
        const std::uint32_t index = TakeWord();
        const auto page = Take(FlashArray::kPageSizeBytes);
        if (index >= device.Flash().PageCount()) ThrowUnusable(path_, "it has too much flash");
        device.Flash().Preset(index * FlashArray::kPageSizeBytes, page);
    }
}

}  // namespace

std::unique_ptr<SimulatedDevice> OpenContents(const std::string& path, const DeviceOptions& today,
                                              Clock* clock) {
    const auto bytes = ReadWhole(path);
    if (!bytes) return std::make_unique<SimulatedDevice>(today, clock);
    Decoder decoder(path, *bytes);
    decoder.CheckFrame();
    const DeviceOptions kept = decoder.Definition();
    auto device = std::make_unique<SimulatedDevice>(ReopenOptions(kept, today), clock);
    decoder.Fill(*device);
    return device;
}

void SaveContents(const std::string& path, const SimulatedDevice& device) {
    const std::string temporary = fmt::format("{}.tmp-{}", path, getpid());
    try {
        WriteDurably(temporary, Encode(device), path);
        if (std::rename(temporary.c_str(), path.c_str()) != 0) {
            ThrowSystemError("Replacing", path, errno);
        }
    } catch (...) {
        unlink(temporary.c_str());
        throw;
    }
    SyncDirectoryOf(path);
}

}  // namespace target
