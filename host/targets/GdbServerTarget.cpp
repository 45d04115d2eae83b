// From the options' texts to a connected target, and what the host knows of its loader.

#include "host/targets/GdbServerTarget.h"

#include <fmt/format.h>

#include <utility>

#include "host/base/Errors.h"
#include "host/base/Interrupt.h"
#include "host/facts/FlashMemory.h"
#include "host/facts/LoaderMemory.h"

namespace host {

namespace {

namespace gdb = target::gdb;

// Both parameter blocks.
constexpr gdb::Mailbox kMailbox{
    plugin::kParameterBlocks[0],
    2 * (plugin::kParameterBlocks[1] - plugin::kParameterBlocks[0]),
    plugin::kStatusPending,
};

gdb::GdbOptions ParseOptions(const TargetOptions& options) try {
    gdb::GdbOptions parsed;
    for (const std::string& text : options.gdbOptions)
        gdb::ParseGdbOption(text, parsed);
    parsed.loader = options.loader.value_or("");
    parsed.device = {
        plugin::kLoaderBuffers,
        plugin::kNothingAt,
        {{plugin::kDebugStatusRegister, plugin::kDebuggedBit, plugin::kHaltedBit}},
    };
    return parsed;
} catch (const gdb::GdbOptionError& error) {
    throw Failure(ExitStatus::WrongUsage, fmt::format("--gdb-option: {}", error.what()));
}

gdb::PacketTrace PacketsTo(const TraceLine& trace) {
    if (!trace) return {};
    return [trace](const char* direction, const std::string& packet) {
        trace("gdb", fmt::format("{} {}", direction, packet));
    };
}

gdb::Address ParseServer(const TargetOptions& options) try {
    return gdb::Address::Parse(*options.gdb);
} catch (const std::invalid_argument& error) {
    throw Failure(ExitStatus::WrongUsage, fmt::format("--gdb: {}", error.what()));
}

std::unique_ptr<gdb::GdbTarget> Connect(const TargetOptions& options, const TraceLine& trace) try {
    const gdb::GdbOptions parsed = ParseOptions(options);
    return std::make_unique<gdb::GdbTarget>(ParseServer(options), parsed, kMailbox, Interrupted,
                                            PacketsTo(trace));
} catch (const target::TargetError& error) {
    if (Interrupted()) throw Failure(ExitStatus::Interrupted, "interrupted");
    throw Failure(ExitStatus::Unreachable, error.what());
}

}  // namespace

GdbServerTarget::GdbServerTarget(const TargetOptions& options, const TraceLine& trace)
    : server_(*options.gdb), own_(host::Connect(options, trace)), target_(*own_) {}

ProbeConnector::ProbeConnector(const TargetOptions& options, TraceLine trace)
    : address_(ParseServer(options)), options_(ParseOptions(options)), trace_(std::move(trace)) {
    if (options_.loader.empty()) return;
    try {
        gdb::ReadLoaderFile(options_.loader);
    } catch (const target::TargetError& error) {
        throw Failure(ExitStatus::BadFile, error.what());
    }
}

std::unique_ptr<gdb::GdbTarget> ProbeConnector::Connect() const {
    return std::make_unique<gdb::GdbTarget>(address_, options_, kMailbox, Interrupted,
                                            PacketsTo(trace_), gdb::GdbTarget::Lent());
}

std::vector<base::AddressRange> LoaderMemory(const gdb::GdbTarget& probe,
                                             const std::string& directory) {
    return probe.MemoryOfProgram(plugin::kLoaderFile, directory + plugin::kLoaderSubdirectory);
}

std::string GdbServerTarget::Advice() {
    if (!target_.IsConnected()) return "is the server still running, and its probe connected?";
    const std::string description = target_.Description();
    return fmt::format(
        "the server answers, but its target{} isn't a device of this family, or has no power",
        description.empty() ? "" : " (" + description + ")");
}

std::optional<ServerFacts> GdbServerTarget::Server() const {
    const gdb::Profile& profile = target_.Server();
    const gdb::Profile& cure = profile.reads == nullptr ? *gdb::FindProfile("openocd") : profile;
    return ServerFacts{.name = fmt::format("the GDB server at {} ({})", server_, profile.title),
                       .packetBytes = target_.PacketSize(),
                       .binaryWrites = target_.WritesBinary(),
                       .reportsReads = fmt::format(
                           "{}{}", &cure == &profile ? "" : "if it is OpenOCD, ", cure.reads)};
}

std::vector<base::AddressRange> GdbServerTarget::LoaderMemory(const std::string& directory) {
    return host::LoaderMemory(target_, directory);
}

void GdbServerTarget::RequireLoader(const std::string& directory) try {
    target_.RequireProgram(plugin::kLoaderFile, directory + plugin::kLoaderSubdirectory);
} catch (const target::TargetError& error) {
    throw Failure(ExitStatus::BadFile, error.what());
}

}  // namespace host
