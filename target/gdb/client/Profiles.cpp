// The table of servers.

#include "target/gdb/client/Profiles.h"

#include <algorithm>

namespace target::gdb {

namespace {

constexpr Profile kProfiles[] = {
    {
        .name = "generic",
        .saysVersion = nullptr,
        .reset = "reset halt",
        .trueX = false,
        .triesLive = true,
        .detachResumes = true,
        .reads = nullptr,
        .title = "any other",
        .start = "as its manual says",
        .options = "--gdb :PORT --gdb-option reset=COMMAND",
        .tried = "what isn't known of a server is assumed at its worst",
    },
    // Answers a binary write when it has it in its buffer, and tells the next one of a failure.
    // "D" runs an event handler and leaves the target as it is.
    {
        .name = "openocd",
        .saysVersion = "Open On-Chip Debugger",
        .reset = "reset halt",
        .trueX = false,
        .triesLive = true,
        .detachResumes = false,
        .reads =
            "start it with openocd -c \"gdb_report_data_abort enable\" and your -f files behind "
            "it; that can't be set later",
        .title = "OpenOCD",
        .start = "openocd -c \"gdb_report_data_abort enable\" -f interface/PROBE.cfg -f "
                 "target/PART.cfg",
        .options = "--gdb :3333",
        .tried = "0.12, on a modelled debug port in front of the simulated device",
    },
    {
        .name = "jlink",
        .saysVersion = "SEGGER",
        .reset = "reset",
        .trueX = false,
        .triesLive = true,
        .detachResumes = true,
        .reads = nullptr,
        .title = "J-Link GDB Server",
        .start = "JLinkGDBServerCLExe -device Cortex-M4 -if SWD -noir",
        .options = "--gdb :2331 --gdb-option \"server=jlink,init=exec ExcludeFlashCacheRange "
                   "0x0-0x7ffffff\"",
        .tried = "not tried; without that command it answers reads of flash from a cache",
    },
    {
        .name = "pyocd",
        .saysVersion = "pyOCD",
        .reset = "reset halt",
        .trueX = false,
        .triesLive = true,
        .detachResumes = true,
        .reads = nullptr,
        .title = "pyOCD",
        .start = "pyocd gdbserver -t cortex_m --persist -O cache.enable_memory=false",
        .options = "--gdb :3333 --gdb-option server=pyocd",
        .tried = "not tried; without -O it answers reads of flash from a cache",
    },
    // Its monitor command "reset" drops the target; "vRun" resets it and leaves it halted. While
    // the target runs it takes nothing in but the interrupt.
    {
        .name = "blackmagic",
        .saysVersion = "Black Magic",
        .reset = "packet:vRun",
        .trueX = false,
        .triesLive = false,
        .detachResumes = true,
        .reads = nullptr,
        .title = "Black Magic Probe",
        .start = "socat TCP-LISTEN:3333,reuseaddr FILE:/dev/ttyACM0,raw,echo=0",
        .options = "--gdb :3333 --gdb-option server=blackmagic,attach=1,init=swdp_scan",
        .tried = "not tried",
    },
    // Any byte stops the machine. Its board has no registers of ours.
    {
        .name = "qemu",
        .saysVersion = nullptr,
        .reset = "system_reset",
        .trueX = true,
        .triesLive = false,
        .detachResumes = true,
        .reads = nullptr,
        .title = "QEMU",
        .start = "qemu-system-arm -M mps2-an385 -S -display none -gdb tcp::1234",
        .options = "--gdb :1234 --gdb-option server=qemu,ram-end=20010000",
        .tried = "7.2, with the example loader; the board lacks the registers of these devices",
    },
    {
        .name = "corvane",
        .saysVersion = "corvane-flash",
        .reset = "reset halt",
        .trueX = true,
        .triesLive = false,
        .detachResumes = true,
        .trusted = true,
        .reads = nullptr,
        .title = "corvane-flash (simulated device)",
        .start = "corvane-flash --sim quen serve 3333",
        .options = "--gdb :3333",
        .tried = "this version",
    },
};

}  // namespace

std::span<const Profile> Profiles() {
    return kProfiles;
}

const Profile* FindProfile(std::string_view name) {
    const auto* found =
        std::ranges::find_if(kProfiles, [&](const Profile& row) { return name == row.name; });
    return found == std::end(kProfiles) ? nullptr : found;
}

const Profile& ProfileOf(std::string_view version) {
    for (const Profile& row : kProfiles)
        if (row.saysVersion != nullptr && version.find(row.saysVersion) != version.npos) return row;
    return kProfiles[0];
}

}  // namespace target::gdb
