// A board behind a debug probe, for servers that drive the probe's pins: the simulated device with
// an ARM debug port in front of it. Serves one debugger on a free port of this machine, whose
// number is its first line, keeps the device in its file and says how it was left.
//
// probe_model DEVICE FILE [FAULT...]; a fault is
//   cable-off=ADDRESS:N   in place of the Nth access to that word
//   reset-time=MS         a reset takes so long
//   crash-after=MS        what is started in RAM runs into a fault
//   never-halts

#include <fmt/format.h>

#include <cstdio>
#include <fstream>
#include <iterator>

#include "target/gdb/wire/Socket.h"
#include "target/simulated/Contents.h"
#include "tests/probe/Core.h"
#include "tests/probe/Wire.h"

namespace {

using namespace target;
using namespace std::chrono_literals;

struct Faults {
    probe::CoreFaults core;
    probe::Cable::Fault cable;
};

void AddFault(Faults& faults, const std::string& text) {
    const std::string name = text.substr(0, text.find('='));
    const std::string value = text.substr(std::min(name.size() + 1, text.size()));
    if (name == "cable-off")
        faults.cable = {static_cast<std::uint32_t>(std::stoul(value, nullptr, 16)),
                        static_cast<unsigned>(std::stoul(value.substr(value.find(':') + 1)))};
    else if (name == "reset-time")
        faults.core.resetTime = std::chrono::milliseconds(std::stoul(value));
    else if (name == "crash-after")
        faults.core.crashesAfter = std::chrono::milliseconds(std::stoul(value));
    else if (name == "never-halts")
        faults.core.neverHalts = true;
    else
        throw std::invalid_argument("no fault " + text);
}

std::unique_ptr<SimulatedDevice> OpenDevice(const std::string& options, const std::string& path) {
    const DeviceOptions device = ParseDeviceOptions(options);
    std::ifstream file(path, std::ios::binary);
    if (!file) return std::make_unique<SimulatedDevice>(device);
    const std::istreambuf_iterator<char> first(file);
    return DecodeContents({first, {}}, device);
}

void Serve(gdb::Socket debugger, probe::Wire& wire) try {
    for (;;) {
        const auto levels = wire.Take(debugger.Read(gdb::After(10s)));
        if (!levels) return;
        debugger.Write(*levels, gdb::After(10s));
    }
} catch (const gdb::SocketError&) {
    // The debugger is gone without a word.
}

int Run(const std::vector<std::string>& words) {
    Faults faults;
    for (std::size_t i = 2; i < words.size(); ++i)
        AddFault(faults, words[i]);
    const auto device = OpenDevice(words.at(0), words.at(1));
    ServedSimulation served(
        *device, [](const std::string& text) { fmt::print(stderr, "{}\n", text); }, [] {});
    probe::Core core(served, faults.core);
    probe::Cable cable(core, faults.cable);
    probe::AccessPort memory(cable);
    probe::DebugPort port(memory);
    probe::Wire wire(port, cable);

    gdb::Socket listener = gdb::Socket::Listen(gdb::Address::Parse("127.0.0.1:0"), {});
    fmt::print("{}\n", listener.Port());
    std::fflush(stdout);
    gdb::Socket debugger = listener.Accept(gdb::After(30s));
    if (!debugger.IsOpen()) return 1;
    Serve(std::move(debugger), wire);
    fmt::print("{}\n", core.StateText());
    std::ofstream(words.at(1), std::ios::binary) << EncodeContents(*device);
    return 0;
}

}  // namespace

int main(int argc, char** argv) try {
    return Run({argv + 1, argv + argc});
} catch (const std::exception& error) {
    fmt::print(stderr, "probe_model: {}\n", error.what());
    return 2;
}
