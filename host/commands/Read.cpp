// corvane-flash read: flash into a file, in the format that the file's extension asks for.

#include <fmt/format.h>

#include <filesystem>

#include "host/base/Files.h"
#include "host/commands/Commands.h"
#include "host/driver/FlashDevice.h"
#include "host/output/Summary.h"

namespace host::commands {

namespace {

/// What can be known to be wrong before the device is asked for anything.
image::Format CheckTarget(const Options& options, const std::string& path) {
    const image::Format format = image::FormatForWriting(path);
    if (format == image::Format::Elf)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("{}: flash can't be written as an ELF file; name a .bin, .hex or "
                                  ".srec file",
                                  path));
    std::error_code ignored;
    if (!options.force && std::filesystem::is_regular_file(path, ignored))
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("{} exists; overwrite it with --force", path));
    return format;
}

Outcome RunOn(Context& context, FlashDevice& device, const std::string& path,
              image::Format format) {
    const AddressRange range = device.RangeInFlash(context.options.range);
    device.Halt();
    device.Meter().Expect(Phase::Read, range.Size());
    device.Meter().Begin(Phase::Read);
    image::Image image;
    image.Add(range.first, device.ReadFlash(range), "flash");
    device.Meter().End();
    WriteWholeFile(path, image::FormatImage(image, format), "the flash contents");
    ShowSummary(context.reporter, device.Meter());
    return {.result = {{"file", path},
                       {"format", image::FormatName(format)},
                       {"address", range.first},
                       {"bytes", range.Size()},
                       {"phases", PhasesJson(device.Meter())}}};
}

Outcome Run(Context& context) {
    const std::string path = context.options.argument.value_or("");
    const image::Format format = CheckTarget(context.options, path);
    return WithDevice(context,
                      [&](FlashDevice& device) { return RunOn(context, device, path, format); });
}

}  // namespace

CommandRow Read() {
    return {"read",
            "Read flash back into a file",
            "The extension chooses the format: .hex, .ihex for Intel HEX, .srec, .s19 and the like "
            "for S-records, raw binary for all others.",
            "  corvane-flash read backup.hex\n"
            "  corvane-flash read page.bin --range 0x400-0x7ff",
            {{"FILE", "", "The file to write", &Options::argument, Offers::Files, {}, true},
             RangeOption("The addresses to read; default: the whole flash"),
             {"--force", "", "Overwrite the file if it exists", &Options::force}},
            Run};
}

}  // namespace host::commands
