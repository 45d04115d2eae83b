// The options that several commands share, as structs for theirs to stand on, and their rows.

#pragma once

#include <optional>
#include <string>
#include <vector>

#include "host/cli/Option.h"
#include "host/commands/Context.h"

namespace host {

class FlashDevice;

}  // namespace host

namespace host::commands {

struct RangeChoice {
    std::vector<std::string> ranges;
};
Option<RangeChoice> RangeOption(const char* help);

struct ImageForm {
    std::optional<std::string> format;
    std::optional<std::string> base;
};
Option<ImageForm> FormatOption();
Option<ImageForm> BaseOption();

struct ImageFiles : ImageForm {
    std::vector<std::string> files;
};
Option<ImageFiles> ImagesArgument(bool isRequired);

/// Failure (WrongUsage).
image::ReadOptions ReadOptionsOf(const ImageForm& form);

/// The images that a command names, which from now on are files in use. Failure.
LoadedImages ReadNamed(Context& context, const std::vector<std::string>& files,
                       const ImageForm& form);

struct DryRun {
    bool dryRun = false;
};
Option<DryRun> DryRunOption();

struct ComparisonKind {
    std::optional<std::string> compare;
};
Option<ComparisonKind> CompareOption();

/// Lets the device compare as the option says. Failure (WrongUsage).
void ApplyTo(FlashDevice& device, const ComparisonKind& options);

/// ", by CRC-32", where it was.
const char* ByChecksumText(bool byChecksum);

struct Comparing {
    bool noVerify = false;
};
Option<Comparing> NoVerifyOption();

struct Committing {
    bool commit = false;
};
Option<Committing> CommitOption();

struct AnyAddress {
    bool anyAddress = false;  ///< program a MAC address that no device should have
};
Option<AnyAddress> AnyAddressOption();

struct Running {
    bool run = false;
};
Option<Running> RunOption(const char* help);

}  // namespace host::commands
