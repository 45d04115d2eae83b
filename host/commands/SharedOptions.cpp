// A row of the table is written once, however many commands have it.

#include "host/commands/SharedOptions.h"

#include "host/driver/FlashDevice.h"

namespace host::commands {

Option<RangeChoice> RangeOption(const char* help) {
    return {&RangeChoice::ranges, {"--range", "A-B|A+LENGTH", help}};
}

Option<ImageForm> FormatOption() {
    return {&ImageForm::format,
            {.names = "--format",
             .value = "FORMAT",
             .help = "Read the files as elf, ihex, srec or bin, whatever they look like",
             .choices = {"elf", "ihex", "srec", "bin"}}};
}

Option<ImageForm> BaseOption() {
    return {&ImageForm::base, {"--base", "ADDRESS", "Where the raw binary goes (hexadecimal)"}};
}

Option<ImageFiles> ImagesArgument(bool isRequired) {
    return {&ImageFiles::files,
            {.names = "FILE",
             .help = "Image files, joined before use; raw binary as FILE@ADDRESS; - is standard "
                     "input",
             .offers = Offers::Files,
             .isRequired = isRequired}};
}

image::ReadOptions ReadOptionsOf(const ImageForm& form) {
    image::ReadOptions read;
    if (form.format) read.format = image::FormatFromName(*form.format);
    if (form.base) read.base = ParseHexArgument(*form.base, "--base");
    return read;
}

LoadedImages ReadNamed(Context& context, const std::vector<std::string>& files,
                       const ImageForm& form) {
    context.imageFiles = files;
    return ReadImages(files, ReadOptionsOf(form));
}

Option<DryRun> DryRunOption() {
    return {&DryRun::dryRun,
            {"--dry-run", "",
             "Show what would be done and how it would end, and change nothing; a board is left "
             "halted"}};
}

Option<ComparisonKind> CompareOption() {
    return {&ComparisonKind::compare,
            {.names = "--compare",
             .value = "HOW",
             .help = "bytes: read what is compared, also where the target can tell its CRC-32",
             .choices = {"auto", "bytes"}}};
}

void ApplyTo(FlashDevice& device, const ComparisonKind& options) {
    if (options.compare == "bytes") device.CompareBytes();
}

const char* ByChecksumText(bool byChecksum) {
    return byChecksum ? ", by CRC-32" : "";
}

Option<Comparing> NoVerifyOption() {
    return {&Comparing::noVerify, {"--no-verify", "", "Leave out the read-back and comparison"}};
}

Option<Committing> CommitOption() {
    return {&Committing::commit, {"--commit", "", "Make the value survive a reset"}};
}

Option<AnyAddress> AnyAddressOption() {
    return {&AnyAddress::anyAddress,
            {"--any-address", "", "Program a multicast, all-zeros or all-ones address"}};
}

Option<Running> RunOption(const char* help) {
    return {&Running::run, {"--run", "", help}};
}

}  // namespace host::commands
