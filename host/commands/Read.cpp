// corvane-flash read: flash into a file, in the format that the file's extension asks for.

#include <fmt/format.h>
#include <unistd.h>

#include "host/commands/Commands.h"
#include "host/driver/FlashDevice.h"
#include "host/output/Summary.h"

namespace host::commands {

namespace {

/// What can be known to be wrong before the device is asked for anything.
image::Format CheckTarget(const Context& context, const std::string& path) {
    const Options& options = context.options;
    const image::Format format =
        options.format ? *image::FormatFromName(*options.format) : image::FormatForWriting(path);
    if (format == image::Format::Elf)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("{}: flash can't be written as an ELF file; name a .bin, .hex or "
                                  ".srec file",
                                  path));
    if (path == "-" && options.json)
        throw Failure(ExitStatus::WrongUsage,
                      "'read -' and --json both want standard output; name a file");
    FilesInUse files = InputFiles(context);
    files.Add(options.trace.value_or(""), "the trace");
    files.RequireOther(path, "the flash contents");
    if (path != "-") RequireWritable(image::kImageFile, path, ExistingFiles(options));
    return format;
}

/// A terminal shows what people can read.
bool WantsDump(const std::string& path, image::Format format) {
    return path == "-" && format == image::Format::Binary && isatty(STDOUT_FILENO) != 0;
}

Outcome ReadOn(Context& context, FlashDevice& device, const std::string& path,
               image::Format format) {
    const base::AddressRange range = device.RangeInFlash(context.options.range);
    device.Halt();
    device.Meter().Expect(Phase::Read, range.Size());
    device.Meter().Begin(Phase::Read);
    image::Image image;
    image.Add(range.first, device.ReadFlash(range), "flash");
    device.Meter().End();
    const std::string contents =
        WantsDump(path, format) ? image::FormatDump(image) : image::FormatImage(image, format);
    if (path == "-") {
        context.reporter.Data(contents);
    } else {
        WriteWholeFile(image::kImageFile, path, contents, ExistingFiles(context.options));
        ShowSummary(context.reporter, device.Meter().Phases());
    }
    return {.result = {{"file", path},
                       {"format", image::FormatName(format)},
                       {"address", range.first},
                       {"bytes", range.Size()},
                       {"phases", PhasesJson(device.Meter().Phases())}}};
}

Outcome RunRead(Context& context) {
    const std::string path = context.options.argument.value_or("");
    const image::Format format = CheckTarget(context, path);
    return WithDevice(context,
                      [&](FlashDevice& device) { return ReadOn(context, device, path, format); });
}

}  // namespace

CommandRow Read() {
    return {"read",
            "Read flash back into a file",
            "The extension chooses the format: .hex, .ihex for Intel HEX, .srec, .s19 and the like "
            "for S-records, raw binary for all others. A terminal shows raw binary as a hex dump.",
            "  corvane-flash read backup.hex\n"
            "  corvane-flash read page.bin --range 0x400-0x7ff\n"
            "  corvane-flash read - | sha256sum",
            {{"FILE",
              "",
              "The file to write; - is standard output",
              &Options::argument,
              Offers::Files,
              {},
              true},
             RangeOption("The addresses to read; default: the whole flash"),
             {"--format",
              "FORMAT",
              "Write ihex, srec or bin, whatever the extension says",
              &Options::format,
              Offers::Nothing,
              {"ihex", "srec", "bin"}}},
            RunRead};
}

}  // namespace host::commands
