// The files that outlive a run of the tool: settings in TOML, and a simulated device's contents.
// The first byte chooses. Whatever a file holds, it is read or refused in words, and what was read
// survives being written and read again.

#include <sys/mman.h>
#include <unistd.h>
#include <zlib.h>

#include <string>

#include "base/ByteOrder.h"
#include "fuzz/Require.h"
#include "host/base/Errors.h"
#include "host/settings/SettingFiles.h"
#include "target/simulated/Contents.h"

namespace {

/// A file in memory that has a path.
const std::string& ScratchFile(std::string_view contents) {
    static const int file = memfd_create("kept", 0);
    static const std::string path = "/proc/self/fd/" + std::to_string(file);
    const auto size = static_cast<ssize_t>(contents.size());
    Require(ftruncate(file, 0) == 0 && pwrite(file, contents.data(), contents.size(), 0) == size,
            "there is a file to write");
    return path;
}

void ReadSettings(std::string_view contents, bool kept) {
    host::SettingTexts texts;
    try {
        texts = host::ReadSettingFile(ScratchFile(contents), true, kept);
    } catch (const host::Failure& failure) {
        Require(failure.Status() == host::ExitStatus::BadFile, "a refusal is of the file");
        RequireText(failure.what());
        return;
    }
    const std::string path = "/dev/shm/corvane-fuzz-" + std::to_string(getpid()) + ".toml";
    host::WriteKeptSettings(path, texts);
    Require(host::ReadSettingFile(path, true, true) == texts, "kept settings read the same");
    unlink(path.c_str());
}

/// No mutation would hit the checksum, so that it is made right.
void ReadContents(std::string contents) {
    const auto sum =
        crc32_z(0, reinterpret_cast<const unsigned char*>(contents.data()), contents.size());
    contents += base::WordBytes(static_cast<std::uint32_t>(sum));
    try {
        const auto device = target::DecodeContents(contents, target::DefaultDeviceOptions());
        const std::string encoded = target::EncodeContents(*device);
        const auto same = target::DecodeContents(encoded, target::DefaultDeviceOptions());
        Require(target::EncodeContents(*same) == encoded, "kept contents read the same");
    } catch (const target::ContentsError& error) {
        RequireText(error.what());
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (size == 0) return 0;
    const std::string bytes(reinterpret_cast<const char*>(data) + 1, size - 1);
    if (data[0] % 4 == 0)
        ReadContents(bytes);
    else
        ReadSettings(bytes, data[0] % 2 == 0);
    return 0;
}
