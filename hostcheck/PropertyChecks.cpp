// SetProperty: whether the host takes all that the plug-in stores, and keeps it as it is.

#include <algorithm>
#include <vector>

#include "device/SettingKeys.h"
#include "hostcheck/Checks.h"
#include "hostcheck/KnownSettings.h"

namespace hostcheck {

namespace {

/// A small device without anything special, whose flash nobody touches. The plug-in publishes it
/// first; a family that it doesn't know is the empty text.
constexpr struct {
    const char* key;
    const char* value;
} kPublished[] = {{Setting::DeviceInfoFlashSize, "64KB"},
                  {Setting::DeviceInfoRAMSize, "16KB"},
                  {Setting::DeviceInfoSectorSize, "1KB"},
                  {Setting::DeviceInfoFamily, ""},
                  {Setting::DeviceInfoFamily, "Host check"}};

std::string TakesWhatIsPublished(CheckedHost& host) {
    for (const auto& [key, value] : kPublished) {
        try {
            host.Set(key, value);
        } catch (const Breach& breach) {
            throw Breach(breach.what() + std::string(" for ") + key + " as " + Quoted(value));
        }
    }
    return "";
}

std::vector<std::optional<std::string>> AllValues(CheckedHost& host) {
    std::vector<std::optional<std::string>> values;
    for (const KnownSetting& setting : KnownSettings())
        values.push_back(host.Get(setting.key));
    return values;
}

/// Puts back what a setting was. One that the host didn't have becomes what the plug-in makes of it
/// when there is nothing to tell.
class KeptSetting {
  public:
    KeptSetting(CheckedHost& host, const char* key)
        : host_(host), key_(key), before_(host.Get(key).value_or("--")) {}
    KeptSetting(const KeptSetting&) = delete;
    KeptSetting& operator=(const KeptSetting&) = delete;
    ~KeptSetting() {
        try {
            host_.Set(key_, before_);
        } catch (const std::exception&) {
            // The check that failed to write says so.
        }
    }

  private:
    CheckedHost& host_;
    const char* key_;
    std::string before_;
};

/// Stores a value out of memory that is overwritten afterwards, and looks for it.
void RequireKept(CheckedHost& host, const std::string& name, const std::string& value) {
    std::string nameMemory = name;
    std::string valueMemory = value;
    host.Set(nameMemory, valueMemory);
    std::fill(nameMemory.begin(), nameMemory.end(), '?');
    std::fill(valueMemory.begin(), valueMemory.end(), '?');
    const auto came = host.Get(name);
    if (came == value) return;
    throw Breach((came ? Quoted(*came) : "null") + " after " + Quoted(value) + " was set for " +
                 name);
}

// The one setting that nobody but the plug-in writes, and that means nothing between two runs.
std::string KeepsWhatIsSet(CheckedHost& host) {
    const KeptSetting kept(host, Setting::FlashChecksumValue);
    for (const char* value : {"1", "89abcdef", "Tolva Rev.B", "--"})
        RequireKept(host, Setting::FlashChecksumValue, value);
    return "";
}

// As long as the longest text that a setting needs, and a little more.
std::string KeepsLongTexts(CheckedHost& host) {
    const KeptSetting kept(host, Setting::FlashChecksumValue);
    RequireKept(host, Setting::FlashChecksumValue, std::string(40, '7'));
    return "";
}

// A host that cuts keys short, or keeps one text for all, has another setting changed.
std::string ChangesOneSetting(CheckedHost& host) {
    const KeptSetting kept(host, Setting::FlashChecksumValue);
    const auto before = AllValues(host);
    host.Set(Setting::FlashChecksumValue, "13579bdf");
    const auto after = AllValues(host);
    const auto changed = std::ranges::mismatch(before, after).in1 - before.begin();
    if (before != after)
        throw Breach("another value for " +
                     std::string(KnownSettings()[static_cast<std::size_t>(changed)].key));
    return "";
}

constexpr Check kPropertyChecks[] = {
    {Stage::Initialize, "SetProperty", "null for what the plug-in publishes", TakesWhatIsPublished},
    {Stage::Initialize, "SetProperty", "a copy of the value, which GetProperty returns",
     KeepsWhatIsSet},
    {Stage::Initialize, "SetProperty", "a value of 40 characters kept whole", KeepsLongTexts},
    {Stage::Initialize, "SetProperty", "no change of another setting", ChangesOneSetting},
};

}  // namespace

std::span<const Check> PropertyChecks() {
    return kPropertyChecks;
}

}  // namespace hostcheck
