// corvane-flash read: flash into a file, in the format that the file's extension asks for.

#include <fmt/format.h>

#include "base/system/Terminal.h"
#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/commands/SharedOptions.h"
#include "host/driver/FlashDevice.h"
#include "host/flashing/RangeOperation.h"
#include "host/flashing/ReadRanges.h"
#include "host/output/Summary.h"

namespace host::commands {

namespace {

struct ReadOptions : RangeChoice {
    std::string file;
    std::optional<std::string> format;
    bool trim = false;
};

/// What can be known to be wrong before the device is asked for anything.
image::Format CheckOutput(const Context& context, const ReadOptions& options) {
    const std::string& path = options.file;
    const image::Format format =
        options.format ? *image::FormatFromName(*options.format) : image::FormatForWriting(path);
    if (format == image::Format::Elf)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("{}: flash can't be written as an ELF file; name a .bin, .hex or "
                                  ".srec file",
                                  path));
    if (path == "-" && context.options.json)
        throw Failure(ExitStatus::WrongUsage,
                      "'read -' and --json both want standard output; name a file");
    FilesInUse files = InputFiles(context);
    if (context.options.trace != "-") files.Add(context.options.trace.value_or(""), "the trace");
    files.RequireOther(path, "the flash contents");
    if (path != "-") RequireWritable(image::kImageFile, path, ExistingFiles(context.options));
    return format;
}

/// A terminal shows what people can read.
bool WantsDump(const std::string& path, image::Format format) {
    return path == "-" && format == image::Format::Binary && base::IsTerminal(stdout);
}

/// What was read up to the last byte that isn't blank. Failure (ContentsDiffer) when all of it is.
image::Image WithoutBlankEnd(const image::Image& image) {
    image::Image trimmed;
    for (std::size_t i = image.Sections().size(); i-- > 0;) {
        std::vector<std::uint8_t> bytes = image.Sections()[i].bytes;
        while (trimmed.Empty() && !bytes.empty() && bytes.back() == 0xFF)
            bytes.pop_back();
        trimmed.Add(image.Sections()[i].address, std::move(bytes), "the flash");
    }
    if (trimmed.Empty())
        throw Failure(ExitStatus::ContentsDiffer,
                      "all that was read is blank, and nothing is written; without --trim it is");
    return trimmed;
}

Outcome ReadOn(Context& context, FlashDevice& device, const ReadOptions& options,
               image::Format format) {
    const std::string& path = options.file;
    base::AddressSet ranges;
    for (const base::AddressRange& range : ChooseRanges(device, options.ranges).ranges)
        ranges.Add(range);
    device.Halt();
    image::Image image = ReadRanges(device, device.Meter(), Phase::Read, ranges);
    if (options.trim) image = WithoutBlankEnd(image);
    const bool dump = WantsDump(path, format);
    const std::string contents =
        dump ? image::FormatDump(image) : image::FormatImage(image, format);
    if (format == image::Format::Binary && !dump && contents.size() > image.ByteCount())
        context.reporter.Say(Verbosity::Normal,
                             fmt::format("{} between the ranges are written as 0xff",
                                         SizeText(contents.size() - image.ByteCount())));
    if (path == "-") {
        context.reporter.Data(contents);
    } else {
        WriteWholeFile(image::kImageFile, path, contents, ExistingFiles(context.options));
        ShowSummary(context.reporter, device.Meter().Phases());
    }
    return {.result = {{"file", path},
                       {"format", image::FormatName(format)},
                       {"address", ranges.Ranges().front().first},
                       {"bytes", image.ByteCount()},
                       {"ranges", ToJson(ranges.Ranges())},
                       {"phases", PhasesJson(device.Meter().Phases())}}};
}

Outcome RunRead(Context& context, const ReadOptions& options) {
    const image::Format format = CheckOutput(context, options);
    return WithDevice(
        context, [&](FlashDevice& device) { return ReadOn(context, device, options, format); });
}

}  // namespace

CommandRow Read() {
    return Command<ReadOptions>(
        {.name = "read",
         .help = "Read flash back into a file",
         .details = "The extension chooses the format: .hex, .ihex for Intel HEX, .srec, .s19 and "
                    "the like for S-records, raw binary for all others. A terminal shows raw "
                    "binary as a hex dump. A board is left halted.",
         .example = "  corvane-flash read backup.hex\n"
                    "  corvane-flash read page.bin --range 0x400-0x7ff\n"
                    "  corvane-flash read - | sha256sum"},
        {{&ReadOptions::file,
          {.names = "FILE",
           .help = "The file to write; - is standard output",
           .offers = Offers::Files,
           .isRequired = true}},
         RangeOption("The addresses to read; default: the whole flash; repeated, raw binary has "
                     "0xff between them"),
         {&ReadOptions::trim,
          {"--trim", "", "Leave out the blank bytes (0xff) at the end of what is read"}},
         {&ReadOptions::format,
          {.names = "--format",
           .value = "FORMAT",
           .help = "Write ihex, srec or bin, whatever the extension says",
           .choices = {"ihex", "srec", "bin"}}}},
        RunRead);
}

}  // namespace host::commands
