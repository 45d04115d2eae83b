// Setting texts through the loaded plug-in. The input is a text: a line "Key=Value" changes a
// setting, "Key!" makes it unknown, any other line is run as an operation, "load" as a program
// load.

#include <map>
#include <sstream>

#include "fuzz/Require.h"
#include "tests/support/RecordingHost.h"

namespace {

using test::Plugin;
using test::RecordingHost;

// Small, and quick with its chunks, so that a thousand inputs take a second.
constexpr char kDevice[] = "dorna,flash=16K,sector=1K,ram=8K";
constexpr std::size_t kOperationsMax = 8;

void LoadProgram(Plugin& plugin) {
    static const std::vector<unsigned char> image(600, 0x5A);
    plugin->ResetSettings(0);
    plugin->WriteDataToFlash(image.data(), 0x3F0, 600, 1);
    plugin->ResetSettings(2);
}

void RunLine(RecordingHost& host, Plugin& plugin, const std::string& line) {
    if (const auto at = line.find('='); at != std::string::npos) {
        host.settings[line.substr(0, at)] = line.substr(at + 1).c_str();
    } else if (line.ends_with('!')) {
        host.settings.erase(line.substr(0, line.size() - 1));
    } else if (line == "load") {
        LoadProgram(plugin);
    } else {
        plugin->PerformOperation(line.c_str());
    }
    Require(host.openDisplays == 0 && !host.displayMisused, "displays are balanced");
    Require(host.Device().Violations().empty(), "the hardware's rules are kept");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    RecordingHost host(kDevice);
    const test::Settings ordinary = host.settings;
    Plugin plugin(host);
    std::istringstream lines(std::string(data, data + size));
    std::size_t operations = 0;
    for (std::string line; std::getline(lines, line) && operations < kOperationsMax;) {
        operations += line.find('=') == std::string::npos;
        RunLine(host, plugin, line);
    }
    host.settings = ordinary;
    host.Restart({});
    RunLine(host, plugin, "CalculateChecksum");
    Require(host.errors.empty() && host.settings.contains("FlashChecksumValue"),
            "the device object can still be used");
    return 0;
}
