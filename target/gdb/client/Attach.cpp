// The parts of GdbTarget that find out, before anything is touched, what server and target they
// have to do with.

#include <fmt/format.h>

#include "base/ByteOrder.h"
#include "base/Hex.h"
#include "target/gdb/client/GdbTarget.h"
#include "target/gdb/client/Texts.h"

namespace target::gdb {

// The order counts: each step builds on what those before it have found out, and the first that
// fails ends the connection. Nothing is written to the target's memory before all have passed.
void GdbTarget::Attach() {
    Introduce();
    FindOut(false);
}

void GdbTarget::FindOut(bool stopped) {
    ChooseProfile();
    memory_.AllowBinary(WritesBinary());
    std::string output;
    for (const std::string& command : options_.init)
        output = Monitor(command);
    if (options_.attach) {
        const std::string request = fmt::format("vAttach;{:x}", *options_.attach);
        const std::string reply = connection_.Ask(request);
        const auto stop = ParseStopReply(reply);
        if (!stop) connection_.Reject(request, reply);
        if (stop->kind != StopReply::Kind::Stopped)
            throw ProtocolError(fmt::format("answered \"{}\" to the request to attach{}",
                                            Shown(reply), LastLines(output)));
    }
    if (!stopped) core_.Attach();
    core_.ForgetStops();
    RequireHalted("as the server was told to halt it" + LastLines(output));
    RequireReportedReads();
    OpenLiveServer();
}

void GdbTarget::Introduce() {
    const std::string request = "qSupported:vContSupported+;error-message+";
    const std::string reply = connection_.Ask(request);
    // Not just unknown: a server that says why has something against us.
    if (reply.starts_with("E.")) connection_.Reject(request, reply);
    SetFeatures(ParseFeatures(reply));
    if (features_.noAckMode && connection_.Agrees("QStartNoAckMode"))
        connection_.StopAcknowledging();
}

void GdbTarget::SetFeatures(const Features& features) {
    features_ = features;
    if (features_.packetSize < MemoryPort::kPacketSizeMin)
        throw ProtocolError(fmt::format("takes packets of {} bytes only, too few for any access",
                                        features_.packetSize));
    memory_.SetPacketSize(features_.packetSize);
}

/// Every server has a monitor command, or refuses it; what it says to this one names many of them.
void GdbTarget::ChooseProfile() {
    if (options_.server != nullptr) {
        profile_ = options_.server;
        return;
    }
    try {
        profile_ = &ProfileOf(Monitor("version"));
    } catch (const ProtocolError&) {
        if (connection_.IsLost()) throw;
        profile_ = &ProfileOf(connection_.Output());
    }
}

/// A server of its own for memory needs no halted target, and none of its run control.
void GdbTarget::OpenLiveServer() {
    if (options_.live == GdbOptions::Live::Yes) core_.AssumeLive();
    if (!options_.liveServer) return;
    liveConnection_.emplace(Connect(*options_.liveServer));
    const Features features = ParseFeatures(liveConnection_->Ask("qSupported"));
    liveMemory_.emplace(*liveConnection_);
    liveMemory_->SetPacketSize(std::max(features.packetSize, MemoryPort::kPacketSizeMin));
}

/// A server that hides failed reads makes zeros the contents of whatever it can't read.
void GdbTarget::RequireReportedReads() {
    if (options_.readsTrusted || profile_->trusted || !options_.device.nothingAt) return;
    const std::uint32_t address = *options_.device.nothingAt;
    const std::string reply = connection_.Ask(fmt::format("m{:x},4", address));
    if (IsRefusal(reply)) return;
    if (!base::FromHex(reply)) connection_.Reject(fmt::format("m{:x},4", address), reply);
    const Profile& cure = profile_->reads != nullptr ? *profile_ : *FindProfile("openocd");
    throw ProtocolError(fmt::format(
        "hides reads that fail: it answers \"{}\" for {:#x}, where nothing is, so that a lost "
        "device would seem to hold that; {}{}; or go on with --gdb-option reads=trusted",
        Shown(reply), address, &cure == profile_ ? "" : "if it is OpenOCD, ", cure.reads));
}

/// Some servers say that a target stopped which runs. Nothing is written to such a one.
void GdbTarget::RequireHalted(const std::string& after) {
    if (profile_->trusted || !options_.device.haltStatus) return;
    const auto [address, debugged, halted] = *options_.device.haltStatus;
    const std::string reply = connection_.Ask(fmt::format("m{:x},4", address));
    if (IsRefusal(reply)) return;  // it isn't a core of that kind, or the server keeps it to itself
    const auto bytes = base::FromHex(reply);
    if (!bytes || bytes->size() != 4) connection_.Reject(fmt::format("m{:x},4", address), reply);
    const std::uint32_t status = base::WordOf(*bytes);
    if ((status & debugged) != debugged || (status & halted) == halted) return;
    throw ProtocolError(fmt::format(
        "didn't halt the target: it still runs {}; is its debug port locked, or another "
        "debugger at work?",
        after));
}

}  // namespace target::gdb
