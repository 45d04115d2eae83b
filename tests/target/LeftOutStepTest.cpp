// Every access and every pause of bringing a device up, of erasing and of programming matters to
// some device: the built plug-in works through a target that leaves one step out, each time it
// comes, and somebody who knows nothing of the plug-in looks at the cells. A step is told by the
// operation that it belongs to and by what comes before it there. docs/simulated-device.md has the
// rules.

#include <fmt/format.h>
#include <gtest/gtest.h>
#include <zlib.h>

#include <algorithm>
#include <fstream>
#include <map>
#include <set>
#include <sstream>
#include <utility>

#include "tests/support/Cases.h"
#include "tests/support/Program.h"

namespace {

using test::Plugin;
using test::RecordingHost;
using test::Settings;
using namespace std::chrono_literals;
using Bytes = std::vector<std::uint8_t>;

/// What an access is to whoever reads the plug-in: which register, or what in RAM and flash.
std::string PlaceName(std::uint32_t address) {
    if (address < 0x20000000) return "flash";
    if (address < 0x20001000) return "buffer";
    if (address > 0x30000000) return fmt::format("{:08X}", address);
    return address % 16 == 12 ? "status" : "parameters";
}

using Steps = std::set<std::string>;
enum class How { Whole, Half };

/// In front of a device: keeps steps from it, or half of a pause.
class LeavingOut final : public target::Target {
  public:
    LeavingOut(RecordingHost& host, Steps leftOut, How how)
        : host_(host), leftOut_(std::move(leftOut)), how_(how) {}

    const Steps& Seen() const { return seen_; }

    void Read(void* buffer, std::size_t count, std::uint32_t address, int page,
              std::size_t width) override {
        std::fill_n(static_cast<char*>(buffer), count * width, '\0');
        if (Begin("read " + PlaceName(address)))
            host_.Device().Read(buffer, count, address, page, width);
        // A pause after a look at a command that has ended is another than one between two looks.
        if (address == 0x400FD008 && *static_cast<char*>(buffer) != 0)
            frames_.back().last += " busy";
    }
    void Write(const void* buffer, std::size_t count, std::uint32_t address, int page,
               std::size_t width) override {
        if (Begin("write " + PlaceName(address)))
            host_.Device().Write(buffer, count, address, page, width);
    }
    void LoadProgram(const std::string& fileName, const std::string& directory) override {
        if (Begin("load")) host_.Device().LoadProgram(fileName, directory);
    }
    void Run() override {
        if (Begin("run")) host_.Device().Run();
    }
    void Halt() override {
        if (Begin("halt")) host_.Device().Halt();
    }
    void Reset(bool flag) override {
        if (Begin("reset")) host_.Device().Reset(flag);
    }
    void Pause(std::chrono::nanoseconds time) override {
        if (Begin(fmt::format("sleep {}", time / 1ms)))
            host_.Device().Pause(time);
        else if (how_ == How::Half)
            host_.Device().Pause(std::chrono::milliseconds(time / 1ms / 2));
    }

  private:
    struct Frame {
        std::string operation;
        std::string last = "-";  ///< access, or operation that was called
        std::map<std::string, int> times = {};
    };

    // Which operation is at work stands in the plug-in's trace.
    void FollowTrace() {
        for (; followed_ < host_.transcript.size(); ++followed_) {
            const std::string& line = host_.transcript[followed_];
            const bool begins = line.starts_with("    trace 2 FlashCorvane");
            if (!begins && !line.starts_with("    trace 3 FlashCorvane")) continue;
            const auto begin = line.find_first_not_of(": ", 24);
            const std::string name = line.substr(begin, line.find_first_of("(,", begin) - begin);
            if (begins && frames_.back().operation != name) frames_.push_back({name});
            if (begins) continue;
            const auto at = std::find_if(frames_.rbegin(), frames_.rend(),
                                         [&](const Frame& f) { return f.operation == name; });
            if (at == frames_.rend()) continue;
            frames_.erase(at.base() - 1, frames_.end());
            frames_.back().last = name;
        }
    }

    // False when this is one of the steps.
    bool Begin(const std::string& access) {
        FollowTrace();
        Frame& frame = frames_.back();
        std::string step = fmt::format("{}: {} after {}", frame.operation, access, frame.last);
        const int times = ++frame.times[step];
        const bool loops =
            frame.operation != "InitializeDevice" && frame.operation != "SystemResetAndHalt";
        if (times > 1 && !loops) step += fmt::format(", {}.", times);
        frame.last = access;
        seen_.insert(step);
        return !leftOut_.contains(step);
    }

    RecordingHost& host_;
    const Steps leftOut_;
    const How how_;
    Steps seen_;
    std::vector<Frame> frames_{{""}};
    std::size_t followed_ = 0;
};

/// One device and what its cells should hold.
struct PluginRun {
    PluginRun(const std::string& device, const Settings& settings, const Steps& leftOut, How how)
        : host(device, settings),
          front(host, leftOut, how),
          cells(host.Device().Flash().SizeBytes()) {
        host.transcribe = true;
        host.PutInFront(front);
        for (std::size_t i = 0; i < cells.size(); ++i)
            cells[i] = (i * 7 + i / 1024) & 0xFF;
        host.Device().Flash().Preset(0, cells);
    }

    bool AsExpected() { return host.Device().FlashContents() == cells; }
    bool ChecksumFits() {
        const auto sum = crc32_z(0, cells.data(), cells.size());
        return host.settings["FlashChecksumValue"] == fmt::format("{:x}", sum);
    }
    void Erase(std::uint32_t address, std::uint32_t size) {
        std::fill_n(cells.begin() + address, size, std::uint8_t{0xFF});
    }
    void EraseWhole() { Erase(0, static_cast<std::uint32_t>(cells.size())); }
    void EraseSectors() { Erase(0x1000, 0x1C00); }

    // A whole load, with other bytes each time. What the calls return is nobody's business here.
    void Load(Plugin& plugin, bool check = true) {
        test::PutProgram(cells, ++version);
        test::LoadProgram(plugin, version, check);
    }

    RecordingHost host;
    LeavingOut front;
    Bytes cells;
    int version = 0;
};

bool Describes(PluginRun& run, Plugin& plugin) {
    bool flash = false;
    const char* operations = nullptr;
    plugin->Initialize(&flash, &operations);
    const target::DeviceOptions& options = run.host.Device().Options();
    const auto published = [&](const char* name) { return run.host.settings[name]; };
    return published("DeviceInfoFlashSize") == fmt::format("{}KB", options.flashSizeBytes / 1024) &&
           published("DeviceInfoRAMSize") == fmt::format("{}KB", options.ramSizeBytes / 1024);
}

bool LoadsPages(PluginRun& run, Plugin& plugin) {
    run.EraseSectors();
    run.Load(plugin);
    return run.AsExpected() && run.ChecksumFits();
}

// The loader of the load before is still running.
bool LoadsWithoutStop(PluginRun& run, Plugin& plugin) {
    run.EraseSectors();
    run.Load(plugin, false);
    return run.AsExpected();
}

bool LoadsWhole(PluginRun& run, Plugin& plugin) {
    run.EraseWhole();
    run.Load(plugin, false);
    return run.AsExpected();
}

bool LoadsOnBlank(PluginRun& run, Plugin& plugin) {
    run.EraseWhole();
    run.host.Device().Flash().Preset(0, run.cells);
    run.Load(plugin);
    return run.AsExpected() && run.ChecksumFits();
}

bool ErasesAndChecks(PluginRun& run, Plugin& plugin) {
    run.EraseWhole();
    plugin->PerformOperation("Erase");
    plugin->PerformOperation("CalculateChecksum");
    return run.AsExpected() && run.ChecksumFits();
}

bool Commits(PluginRun& run, Plugin& plugin) {
    plugin->PerformOperation("ProgramMACAddress");
    run.host.Device().Pause(100ms);
    return run.host.Device().CommittedUserRegisters() == std::array{0x00C31B02U, 0x00060504U};
}

// An erase that takes longer than anybody waits for leaves the first half erased.
bool LoadsAfterATimeOut(PluginRun& run, Plugin& plugin) {
    plugin->PerformOperation("Erase");
    run.host.settings["FlashProgramOption"] = "Necessary Pages Only";
    run.Erase(0, static_cast<std::uint32_t>(run.cells.size() / 2));
    return LoadsWithoutStop(run, plugin);
}

/// Works on one device after each other.
struct Task {
    std::vector<bool (*)(PluginRun&, Plugin&)> works;
    Settings settings;
};
const Settings kCrc = {{"FlashProgramCRCOption", "1"}};
const Settings kWhole = {{"FlashProgramOption", "Use the Erase Options Specified Below"},
                         {"FlashEraseType", "Entire Flash"}};

Settings Kept(Settings settings) {
    settings["FlashResetSetting"] = "0";
    return settings;
}

const std::map<std::string, Task> kTasks = {
    {"pages", {{LoadsPages, LoadsPages, Describes}, kCrc}},
    {"pages-kept", {{LoadsPages, LoadsPages, Describes}, Kept(kCrc)}},
    {"without-stop", {{LoadsWithoutStop, LoadsWithoutStop}, {}}},
    {"on-blank",
     {{LoadsOnBlank},
      Kept({{"FlashProgramCRCOption", "1"}, {"FlashProgramOption", "Do Not Erase Flash Memory"}})}},
    {"whole-loads", {{LoadsWhole, LoadsWhole}, kWhole}},
    {"whole-loads-kept", {{LoadsWhole, LoadsWhole}, Kept(kWhole)}},
    {"erase", {{ErasesAndChecks}, kWhole}},
    {"commit", {{Commits}, {}}},
    {"commit-and-erase", {{Commits, ErasesAndChecks}, Kept(kWhole)}},
    {"after-time-out", {{LoadsAfterATimeOut}, kWhole}},
};

/// A statement of the plug-in, the work that goes wrong without it, and the rule that sees to that.
struct Row {
    std::string step;
    std::string device;
    std::string task;
    std::string rule;  ///< "" or "-": the work can't be right without it, on any device
    Steps steps;       ///< the same statement, after something else as well
};

std::vector<Row> Rows() {
    std::vector<Row> rows;
    for (const auto& column : test::ReadTable("target/steps.txt", 5)) {
        const bool sized = column[1].find("flash=") != std::string::npos;
        rows.push_back({column[0],
                        column[1] + (sized ? "" : ",flash=64K"),
                        column[2],
                        column[3] == "-" ? "" : column[3],
                        {column[0]}});
        for (const std::string& step : test::Split(column[4], "; "))
            rows.back().steps.insert(step);
    }
    return rows;
}

// Two readings whose values the plug-in doesn't use but for a line of its trace. No device can tell
// whether it is looked at.
const Steps kWithoutEffect = {"Constructor: read 400FE060 after halt",
                              "Constructor: read 400FE1A0 after read 400FDFC4",
                              "Constructor: read 400FE1A0 after read 400FE008"};

struct Outcome {
    bool right;
    std::string violations;
    Steps seen;
};

Outcome Try(const std::string& device, const std::string& name, const Steps& leftOut,
            How how = How::Whole) {
    const Task& task = kTasks.at(name);
    PluginRun run(device, task.settings, leftOut, how);
    bool right = false;
    try {
        Plugin plugin(run.host);
        right = std::ranges::all_of(task.works, [&](auto work) { return work(run, plugin); });
    } catch (const std::exception&) {
        // No device object: nothing was done.
    }
    return {right, fmt::format("{}", fmt::join(run.host.Device().Violations(), "\n")),
            run.front.Seen()};
}

TEST(LeftOutStep, MakesSomeWorkOnSomeDeviceWrong) {
    for (const Row& row : Rows()) {
        const bool pause = row.step.find(": sleep ") != std::string::npos;
        for (const How how : {How::Whole, How::Half}) {
            if (how == How::Half && !pause) continue;
            SCOPED_TRACE(
                fmt::format("{}{} on {}", row.step, how == How::Half ? ", half" : "", row.device));
            const Outcome outcome = Try(row.device, row.task, row.steps, how);
            EXPECT_TRUE(outcome.seen.contains(row.step)) << "not a step of this work";
            EXPECT_FALSE(outcome.right);
            if (row.rule.empty()) continue;
            EXPECT_NE(outcome.violations.find(fmt::format("[{}]", row.rule)), std::string::npos)
                << outcome.violations;
        }
    }
}

TEST(LeftOutStep, BreaksARuleThatIsDocumented) {
    std::ostringstream document;
    document << std::ifstream(DEVICE_DOCUMENT).rdbuf();
    for (const Row& row : Rows()) {
        const std::string rule = row.rule.empty() ? "" : fmt::format("`{}`", row.rule);
        EXPECT_NE(document.str().find(rule), std::string::npos) << rule;
    }
}

// Nothing is wrong as long as nothing is left out, and no step is missing in the table.
TEST(LeftOutStep, IsInTheTableWhicheverItIs) {
    Steps known = kWithoutEffect;
    std::set<std::pair<std::string, std::string>> works = {
        {"mesk,flash=64K", "erase"}, {"mesk,flash=128K", "erase"}, {"pell,flash=64K", "pages"}};
    for (const Row& row : Rows()) {
        known.insert(row.steps.begin(), row.steps.end());
        works.emplace(row.device, row.task);
    }
    for (const auto& [device, task] : works) {
        SCOPED_TRACE(device);
        const Outcome outcome = Try(device, task, {});
        EXPECT_TRUE(outcome.right);
        EXPECT_EQ(outcome.violations, "");
        for (const std::string& step : outcome.seen)
            EXPECT_TRUE(known.contains(step)) << step;
    }
}

}  // namespace
