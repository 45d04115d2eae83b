// Every access and every pause of bringing a device up, of erasing and of programming matters to
// some device: the built plug-in works through a target that leaves one step out, each time it
// comes, and somebody who knows nothing of the plug-in looks at the cells. A step is told by the
// operation that it belongs to and by what comes before it there. docs/simulated-device.md has the
// rules.

#include <fmt/format.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <map>
#include <numeric>
#include <set>
#include <sstream>
#include <utility>

#include "tests/support/RecordingHost.h"

namespace {

using test::Plugin;
using test::RecordingHost;
using test::Settings;
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
    void Pause(std::uint32_t milliseconds) override {
        if (Begin(fmt::format("sleep {}", milliseconds)))
            host_.Device().Pause(milliseconds);
        else if (how_ == How::Half)
            host_.Device().Pause(milliseconds / 2);
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

struct Section {
    std::uint32_t address;
    std::uint32_t size;
};
// The first of three chunks; they share a sector, and neither begins or ends with a block.
constexpr Section kSections[] = {{0x13F0, 4200}, {0x24D4, 900}};
constexpr std::uint32_t kSectorSize = 1024;

std::uint32_t Crc32(const Bytes& bytes) {
    std::uint32_t crc = ~0U;
    for (const std::uint8_t byte : bytes) {
        crc ^= byte;
        for (int bit = 0; bit < 8; ++bit)
            crc = crc >> 1 ^ ((crc & 1) != 0 ? 0xEDB88320 : 0);
    }
    return ~crc;
}

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
        return host.settings["FlashChecksumValue"] == fmt::format("{:x}", Crc32(cells));
    }
    void Erase(std::uint32_t address, std::uint32_t size) {
        std::fill_n(cells.begin() + address, size, std::uint8_t{0xFF});
    }
    void EraseSectors() {
        for (const auto [address, size] : kSections) {
            const std::uint32_t first = address / kSectorSize * kSectorSize;
            Erase(first, (address + size - first + kSectorSize - 1) / kSectorSize * kSectorSize);
        }
    }

    // A whole load, with other bytes each time. What the calls return is nobody's business here.
    void Load(Plugin& plugin, bool check = true) {
        ++version;
        plugin->ResetSettings(0);
        for (const auto [address, size] : kSections) {
            Bytes image(size);
            std::iota(image.begin(), image.end(), static_cast<std::uint8_t>(0x55 * version));
            std::copy(image.begin(), image.end(), cells.begin() + address);
            plugin->WriteDataToFlash(image.data(), address, size, 1);
        }
        if (check) plugin->ResetSettings(2);
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
    for (int load = 0; load < 2; ++load) {
        run.EraseSectors();
        run.Load(plugin);
        if (!run.AsExpected() || !run.ChecksumFits()) return false;
    }
    return Describes(run, plugin);
}

// The second load comes while the loader of the first is still running.
bool LoadsWithoutStop(PluginRun& run, Plugin& plugin) {
    for (int load = 0; load < 2; ++load) {
        run.EraseSectors();
        run.Load(plugin, false);
        if (!run.AsExpected()) return false;
    }
    return true;
}

bool LoadsWhole(PluginRun& run, Plugin& plugin) {
    for (int load = 0; load < 2; ++load) {
        run.Erase(0, static_cast<std::uint32_t>(run.cells.size()));
        run.Load(plugin, false);
        if (!run.AsExpected()) return false;
    }
    return true;
}

bool LoadsOnBlank(PluginRun& run, Plugin& plugin) {
    run.Erase(0, static_cast<std::uint32_t>(run.cells.size()));
    run.host.Device().Flash().Preset(0, run.cells);
    run.Load(plugin);
    return run.AsExpected() && run.ChecksumFits();
}

bool ErasesAndChecks(PluginRun& run, Plugin& plugin) {
    run.Erase(0, static_cast<std::uint32_t>(run.cells.size()));
    plugin->PerformOperation("Erase");
    plugin->PerformOperation("CalculateChecksum");
    return run.AsExpected() && run.ChecksumFits();
}

bool Commits(PluginRun& run, Plugin& plugin) {
    plugin->PerformOperation("ProgramMACAddress");
    run.host.Device().Pause(100);
    return run.host.Device().CommittedUserRegisters() == std::array{0x00C31B02U, 0x00060504U};
}

bool CommitsAndErases(PluginRun& run, Plugin& plugin) {
    return Commits(run, plugin) && ErasesAndChecks(run, plugin);
}

// An erase that takes longer than anybody waits for leaves the first half erased.
bool LoadsAfterATimeOut(PluginRun& run, Plugin& plugin) {
    plugin->PerformOperation("Erase");
    run.host.settings["FlashProgramOption"] = "Necessary Pages Only";
    run.Erase(0, static_cast<std::uint32_t>(run.cells.size() / 2));
    run.EraseSectors();
    run.Load(plugin, false);
    return run.AsExpected();
}

struct Task {
    bool (*work)(PluginRun&, Plugin&);
    Settings settings;
};
const Task kPages = {LoadsPages, {{"FlashProgramCRCOption", "1"}}};
const Task kPagesKept = {LoadsPages, {{"FlashProgramCRCOption", "1"}, {"FlashResetSetting", "0"}}};
const Task kWithoutStop = {LoadsWithoutStop, {}};
const Task kOnBlank = {LoadsOnBlank,
                       {{"FlashProgramCRCOption", "1"},
                        {"FlashProgramOption", "Do Not Erase Flash Memory"},
                        {"FlashResetSetting", "0"}}};
const Settings kWhole = {{"FlashProgramOption", "Use the Erase Options Specified Below"},
                         {"FlashEraseType", "Entire Flash"}};
const Settings kWholeKept = {{"FlashProgramOption", "Use the Erase Options Specified Below"},
                             {"FlashEraseType", "Entire Flash"},
                             {"FlashResetSetting", "0"}};
const Task kWholeLoads = {LoadsWhole, kWhole};
const Task kWholeLoadsKept = {LoadsWhole, kWholeKept};
const Task kErase = {ErasesAndChecks, kWhole};
const Task kCommit = {Commits, {}};
const Task kCommitAndErase = {CommitsAndErases, kWholeKept};
const Task kAfterTimeOut = {LoadsAfterATimeOut, kWhole};

const char kRavik[] = "ravik,flash=64K";
const char kTolva[] = "tolva,flash=64K";
const char kOrrin[] = "orrin,flash=64K";
const char kQuen[] = "quen,flash=64K";
const char kDorna[] = "dorna,flash=64K,sector=1K";

/// A statement of the plug-in, the work that goes wrong without it, and the rule that sees to that.
struct Row {
    std::string step;
    const char* device;
    const Task& task;
    const char* rule;  ///< null: the work can't be right without it, on any device
    Steps also = {};   ///< the same statement, after something else
};

const Row kRows[] = {
    // Identification
    {"Constructor: read 400FE000 after -", kDorna, kPages, "mapped-address"},
    {"Constructor: halt after read 400FE000", kTolva, kPagesKept, "halted-for-timing"},
    {"Constructor: read 400FE000 after read 400FE060", kDorna, kPages, "mapped-address"},
    {"Constructor: read 400FE008 after read 400FE000", kTolva, kPages, nullptr},
    {"Constructor: read 400FDFC0 after read 400FE000", kDorna, kPages, nullptr},
    {"Constructor: read 400FDFC4 after read 400FDFC0", kDorna, kPages, nullptr},
    // Reset
    {"SystemResetAndHalt: halt after -", kDorna, kWithoutStop, "halted-for-reset"},
    {"SystemResetAndHalt: reset after halt", "tolva,flash=64K,mass-erase-time=6s", kAfterTimeOut,
     "one-command"},
    {"SystemResetAndHalt: sleep 5 after reset", kTolva, kPages, "reset-recovery"},
    {"SystemResetAndHalt: write 400FE040 after sleep 5", kTolva, kPages, "peripheral-reset"},
    {"SystemResetAndHalt: write 400FE044 after write 400FE040", kTolva, kPages, "peripheral-reset"},
    {"SystemResetAndHalt: write 400FE048 after write 400FE044", kTolva, kPages, "peripheral-reset"},
    {"SystemResetAndHalt: sleep 5 after write 400FE048", kTolva, kPages, "peripheral-reset"},
    {"SystemResetAndHalt: write 400FE040 after sleep 5, 2.", kTolva, kPages, "peripheral-reset"},
    {"SystemResetAndHalt: write 400FE044 after write 400FE040, 2.", kTolva, kPages,
     "peripheral-reset"},
    {"SystemResetAndHalt: write 400FE048 after write 400FE044, 2.", kTolva, kPages,
     "peripheral-reset"},
    {"ROMAliasClear: read 400FE000 after -", kTolva, kPages, "rom-alias"},
    {"ROMAliasClear: read 400FE0F0 after read 400FE000", kTolva, kPages, "rom-alias"},
    {"ROMAliasClear: write 400FE0F0 after read 400FE0F0", kTolva, kPages, "rom-alias"},
    {"ROMAliasClear: sleep 10 after write 400FE0F0", "tolva,flash=64K,bandwidth=0", kPages,
     nullptr},
    // Set-up of the three oldest classes
    {"InitializeDevice: write 400FE140 after SystemResetAndHalt", kRavik, kPages, "flash-timing"},
    {"InitializeDevice: write 400FE140 after -", kTolva, kPagesKept, "flash-timing"},
    {"InitializeDevice: halt after write 400FE140", kTolva, kPages, "halted-for-clock"},
    {"InitializeDevice: read 400FE060 after halt", kTolva, kPages, "clock-set-up"},
    {"InitializeDevice: sleep 20 after read 400FE060", kTolva, kPages, "timing-set-up"},
    {"InitializeDevice: write 400FE060 after sleep 20", kTolva, kPages, "clock-set-up"},
    {"InitializeDevice: write 400FE058 after write 400FE060", kTolva, kPages, "clock-set-up"},
    {"InitializeDevice: write 400FE060 after write 400FE058", kTolva, kPages, "clock-set-up"},
    {"InitializeDevice: write 400FE060 after write 400FE060", kTolva, kPages, "clock-set-up"},
    {"InitializeDevice: write 400FE060 after write 400FE060, 2.", kTolva, kPages, "clock-set-up"},
    {"InitializeDevice: write 400FE060 after write 400FE060, 3.", kTolva, kPages, "clock-set-up"},
    {"InitializeDevice: sleep 20 after write 400FE060", kTolva, kPages, "clock-settling"},
    // Fix-ups of the first Orrin and of Quen
    {"InitializeDevice: read 400FE000 after -", kOrrin, kPages, "fix-up"},
    {"InitializeDevice: read 400FE070 after read 400FE000", kOrrin, kPages, "fix-up"},
    {"InitializeDevice: write 400FE070 after read 400FE070", kOrrin, kPages, "fix-up"},
    {"InitializeDevice: write 400FE060 after write 400FE070", kOrrin, kPages, "fix-up"},
    {"InitializeDevice: sleep 20 after write 400FE060", kOrrin, kPages, "clock-settling"},
    {"InitializeDevice: write 400FD0FC after -", kQuen, kPages, "fix-up"},
    {"InitializeDevice: write 400AE2C0 after write 400FD0FC", kQuen, kPages, "fix-up"},
    {"InitializeDevice: write 400FD0FC after write 400AE2C0", kQuen, kPages, "fix-up"},
    // Erase of the whole flash
    {"Erase: write 400FD000 after -", kTolva, kCommitAndErase, "bank"},
    {"Erase: write 400FD000 after write 400FD000", "tolva,flash=192K", kErase, nullptr},
    {"MassErase: halt after -", kDorna, kWholeLoadsKept, "halted-for-erase"},
    {"MassErase: write 400FE40C after halt", "mesk,flash=32K", kErase, "flash-blocks"},
    {"MassErase: sleep 10 after write 400FE40C", "mesk,flash=32K", kErase, "block-write"},
    {"MassErase: write 400FE408 after sleep 10", "mesk,flash=32K", kErase, "flash-blocks"},
    {"MassErase: sleep 10 after write 400FE408", "mesk,flash=32K", kErase, "block-write"},
    {"MassErase: write 400FE404 after sleep 10", "mesk,flash=32K", kErase, "flash-blocks"},
    {"MassErase: sleep 10 after write 400FE404", "mesk,flash=32K", kErase, "block-write"},
    {"MassErase: read 400FE400 after sleep 10", "mesk,flash=32K", kErase, nullptr},
    {"MassErase: write 400FE400 after read 400FE400", "mesk,flash=32K", kErase, "flash-blocks"},
    {"MassErase: write 400FE404 after read 400FE400", "mesk,flash=96K", kErase, "flash-blocks"},
    {"MassErase: sleep 10 after write 400FE400", "mesk,flash=32K", kErase, "block-write"},
    {"MassErase: read 400FE1D0 after halt",
     kDorna,
     kErase,
     "write-key",
     {"MassErase: read 400FE1D0 after sleep 10"}},
    {"MassErase: write 400FD008 after read 400FE1D0", kTolva, kErase, nullptr},
    {"MassErase: sleep 10 after write 400FD008", kTolva, kErase, "status-delay"},
    {"MassErase: read 400FD008 after sleep 10", kTolva, kErase, nullptr},
    {"MassErase: sleep 10 after read 400FD008 busy", "tolva,flash=64K,mass-erase-time=4500ms",
     kErase, nullptr},
    {"MassErase: reset after read 400FD008", kTolva, kWholeLoads, "reset-after-erase"},
    // Erase of sectors
    {"PageErase: halt after -", kDorna, kWithoutStop, "halted-for-erase"},
    {"PageErase: read 400FE1D0 after halt", kDorna, kPages, "write-key"},
    {"PageErase: sleep 5 after read 400FD008",
     "tolva,flash=64K,erase-time=9900us",
     kPages,
     "erase-recovery",
     {"PageErase: sleep 5 after read 400FE1D0"}},
    {"PageErase: write 400FD000 after sleep 5", kTolva, kPages, nullptr},
    {"PageErase: sleep 5 after write 400FD000", kTolva, kPages, "address-set-up"},
    {"PageErase: write 400FD008 after sleep 5", kTolva, kPages, nullptr},
    {"PageErase: sleep 5 after write 400FD008", kTolva, kPages, "status-delay"},
    {"PageErase: read 400FD008 after sleep 5", kTolva, kPages, "erase-recovery"},
    {"PageErase: sleep 5 after read 400FD008 busy", "tolva,flash=64K,erase-time=900ms", kPages,
     nullptr},
    {"PageErase: reset after read 400FD008",
     kTolva,
     kPages,
     "reset-after-erase",
     {"PageErase: reset after read 400FE1D0"}},
    // Programming
    {"WriteDataToFlash: sleep 50 after PageErase",
     kRavik,
     kPages,
     "erase-settling",
     {"WriteDataToFlash: sleep 50 after Erase",
      "WriteDataToFlash: sleep 50 after InitializeDevice"}},
    {"Program: read flash after -", kTolva, kPages, nullptr},
    {"Program: read flash after read flash", kTolva, kPages, nullptr},
    {"Program: halt after read flash", kDorna, kOnBlank, "halted-for-load"},
    {"Program: load after halt", kTolva, kPages, "loaded-for-run"},
    {"Program: run after load", kTolva, kPages, nullptr},
    {"Program: write buffer after run",
     kTolva,
     kPages,
     nullptr,
     {"Program: write buffer after read status"}},
    {"Program: write parameters after write buffer", kTolva, kPages, nullptr},
    {"Program: read status after write parameters",
     "dorna,flash=64K,sector=1K,chunk-time=40ms",
     kPages,
     "buffer-in-use",
     {"Program: read status after read status"}},
    {"WriteDataToFlash: sleep 50 after Program", "dorna,flash=64K,sector=1K,chunk-time=40ms",
     kPages, nullptr},
    // Commit of user registers
    {"UserRegisterOperation: write 400FE1E0 after ParseMACAddressString", kDorna, kCommit, nullptr},
    {"UserRegisterOperation: write 400FE1E4 after write 400FE1E0", kDorna, kCommit, nullptr},
    {"UserRegisterOperation: write 400FD000 after write 400FE1E4",
     kDorna,
     kCommit,
     "commit-address",
     {"UserRegisterOperation: write 400FD000 after read 400FD008"}},
    {"UserRegisterOperation: read 400FE1D0 after write 400FD000", kDorna, kCommit, "write-key"},
    {"UserRegisterOperation: write 400FD008 after read 400FE1D0", kDorna, kCommit, nullptr},
    {"UserRegisterOperation: read 400FD008 after write 400FD008",
     "dorna,flash=64K,commit-time=20ms",
     kCommit,
     "one-command",
     {"UserRegisterOperation: read 400FD008 after read 400FD008 busy"}},
    // What reads the flash for its own sake
    {"CalculateChecksumByAddress: read flash after InitCRC32LUT",
     kTolva,
     kPages,
     nullptr,
     {"CalculateChecksumByAddress: read flash after read flash"}},
};

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

Outcome Try(const char* device, const Task& task, const Steps& leftOut, How how = How::Whole) {
    PluginRun run(device, task.settings, leftOut, how);
    bool right = false;
    try {
        Plugin plugin(run.host);
        right = task.work(run, plugin);
    } catch (const std::exception&) {
        // No device object: nothing was done.
    }
    return {right, fmt::format("{}", fmt::join(run.host.Device().Violations(), "\n")),
            run.front.Seen()};
}

TEST(LeftOutStep, MakesSomeWorkOnSomeDeviceWrong) {
    for (const Row& row : kRows) {
        Steps steps = row.also;
        steps.insert(row.step);
        const bool pause = row.step.find(": sleep ") != std::string::npos;
        for (const How how : {How::Whole, How::Half}) {
            if (how == How::Half && !pause) continue;
            SCOPED_TRACE(
                fmt::format("{}{} on {}", row.step, how == How::Half ? ", half" : "", row.device));
            const Outcome outcome = Try(row.device, row.task, steps, how);
            EXPECT_TRUE(outcome.seen.contains(row.step)) << "not a step of this work";
            EXPECT_FALSE(outcome.right);
            if (row.rule == nullptr) continue;
            EXPECT_NE(outcome.violations.find(fmt::format("[{}]", row.rule)), std::string::npos)
                << outcome.violations;
        }
    }
}

TEST(LeftOutStep, BreaksARuleThatIsDocumented) {
    std::ostringstream document;
    document << std::ifstream(DEVICE_DOCUMENT).rdbuf();
    for (const Row& row : kRows) {
        const std::string rule = row.rule == nullptr ? "" : fmt::format("`{}`", row.rule);
        EXPECT_NE(document.str().find(rule), std::string::npos) << rule;
    }
}

// Nothing is wrong as long as nothing is left out, and no step is missing in the table.
TEST(LeftOutStep, IsInTheTableWhicheverItIs) {
    Steps known = kWithoutEffect;
    std::set<std::pair<std::string, const Task*>> works = {
        {"mesk,flash=64K", &kErase}, {"mesk,flash=128K", &kErase}, {"pell,flash=64K", &kPages}};
    for (const Row& row : kRows) {
        known.insert(row.step);
        known.insert(row.also.begin(), row.also.end());
        works.emplace(row.device, &row.task);
    }
    for (const auto& [device, task] : works) {
        SCOPED_TRACE(device);
        const Outcome outcome = Try(device.c_str(), *task, {});
        EXPECT_TRUE(outcome.right);
        EXPECT_EQ(outcome.violations, "");
        for (const std::string& step : outcome.seen)
            EXPECT_TRUE(known.contains(step)) << step;
    }
}

}  // namespace
