// DeviceOptions: everything that tells one simulated device from another, as a plain value, and
// the option text that users write for it. One table serves parser, help and completion.

#pragma once

#include <chrono>
#include <cstdint>
#include <optional>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>

namespace target {

inline constexpr std::uint64_t kKiB = 1024;

/// An option text that names no device. One line: which class or option, and what is accepted.
class OptionError : public std::invalid_argument {
  public:
    using std::invalid_argument::invalid_argument;
};

enum class LoaderFault {
    None,
    Hangs,  ///< starts, and never finishes a chunk
    Dead,   ///< never starts: its status words hold whatever the RAM held
};

enum class RegisterFault { None, Ones, Zeros };

/// A byte of flash that always reads the same, whatever is erased or programmed.
struct StuckCell {
    std::uint32_t address = 0;
    std::uint8_t value = 0;
};

/// How long the device's own work takes, and what an access over the debug link costs.
struct Timings {
    std::chrono::nanoseconds sectorErase = std::chrono::milliseconds(8);
    std::chrono::nanoseconds massErase = std::chrono::milliseconds(60);
    std::chrono::nanoseconds commit = std::chrono::microseconds(200);
    /// Short enough for a chunk to be done before the smallest next one has been transferred at
    /// the default link speed: a poll that finds it busy costs a host a wait of 100 ms.
    std::chrono::nanoseconds chunk = std::chrono::microseconds(200);
    std::chrono::nanoseconds latency = std::chrono::microseconds(30);
    std::uint64_t bytesPerSecond = 1'000'000;  ///< 0: transfers cost nothing but the latency
};

/// Faults on request. Accesses are counted from 1; every target operation but a pause is one.
struct Faults {
    std::uint64_t failAccess = 0;  ///< this access fails; 0: none
    std::uint64_t failFrom = 0;    ///< this access and all later ones fail; 0: none
    bool eraseNeverEnds = false;
    bool commitNeverEnds = false;
    LoaderFault loader = LoaderFault::None;
    RegisterFault registers = RegisterFault::None;
    std::optional<StuckCell> stuckCell;
};

struct DeviceOptions {
    std::string className;
    std::uint32_t identification = 0;
    std::uint32_t flashSizeBytes = 0;
    std::uint32_t ramSizeBytes = 0;
    std::uint32_t sectorSizeBytes = 0;
    std::uint32_t keyConfiguration = 0;
    Timings timings;
    Faults faults;

    /// Names of the options that were given, "class" among them; the rest holds the defaults of
    /// the class.
    std::set<std::string> given;
};

/// Parses "CLASS[,OPTION=VALUE...]", for example "quen,flash=256K,keyconfig=0xFFFFFFEF".
/// Throws OptionError. Whether a device can have them together is for CheckDeviceOptions.
DeviceOptions ParseDeviceOptions(const std::string& text);

/// The options of a class with nothing given, so that they contradict no kept device.
DeviceOptions DefaultDeviceOptions(const std::string& className = "tolva");

/// Throws OptionError when the options, however they came about, define no device.
void CheckDeviceOptions(const DeviceOptions& options);

/// The text that defines the same device, without timings and faults; it parses back.
std::string DefinitionText(const DeviceOptions& options);

/// What results when a device that was kept is opened with options for today: the kept one's
/// definition with today's timings and faults. Throws OptionError, naming the option and both
/// values, when a given option contradicts the kept device. The result is unchecked.
DeviceOptions ReopenOptions(const DeviceOptions& kept, const DeviceOptions& today);

/// Lines for a help text: each class with its defaults.
std::string DeviceClassesHelp();

/// The same: each option with its meaning.
std::string DeviceOptionsHelp();

/// For shell completion.
const std::vector<std::string>& DeviceClassNames();
const std::vector<std::string>& DeviceOptionNames();

}  // namespace target
