// Here is how checks are run; the calls are in HostCalls.cpp.

#include "hostcheck/HostCheckDevice.h"

namespace hostcheck {

namespace {

using Table = std::span<const Check> (*)();

// Memory comes before halts: a plug-in begins with a read from the target as it was found. In a
// load, flash comes behind the resets that its checks need.
constexpr Table kTables[] = {SettingChecks,     PropertyChecks,   RegisterChecks, RamChecks,
                             CoreChecks,        FlashChecks,      RefusalChecks,  PauseChecks,
                             LoaderStartChecks, LoaderWorkChecks, DisplayChecks};

}  // namespace

HostCheckDevice::HostCheckDevice(const char* variant, const char* text2, const char* text3,
                                 IFlashHost* host)
    : host_(host), report_(host_) {
    Require(variant != nullptr && text2 != nullptr && text3 != nullptr, "CreateFlashDevice2",
            "three texts", "null");
    for (const Table table : kTables)
        for (const Check& check : table())
            if (check.stage == Stage::Creation) Run(check);
}

void HostCheckDevice::Examine(const char* call, std::initializer_list<Stage> stages,
                              const char* unseen) {
    host_.loader = {};
    for (const Stage stage : stages)
        for (const Table table : kTables)
            for (const Check& check : table())
                if (check.stage == stage) Run(check);
    report_.Summarise(call);
    report_.Say(unseen);
    if (const std::string rest = NotRunYet(); !rest.empty())
        report_.Say("Not run yet with this device object:" + rest);
}

void HostCheckDevice::Run(const Check& check) {
    const std::string slot = std::string(check.slot) + ": ";
    try {
        const std::string seen = check.run(host_);
        report_.Note(Verdict::Holds,
                     slot + "ok: " + check.expected + (seen.empty() ? "" : "; " + seen));
    } catch (const NotChecked& reason) {
        report_.Note(Verdict::NotChecked,
                     slot + "not checked: " + check.expected + "; " + reason.what());
    } catch (const Breach& breach) {
        report_.Note(Verdict::Fails,
                     slot + "expected " + check.expected + "; came " + breach.what());
    }
}

void HostCheckDevice::Require(bool holds, const std::string& call, const std::string& expected,
                              const std::string& came) {
    if (!holds) report_.Note(Verdict::Fails, call + ": expected " + expected + "; came " + came);
}

std::string HostCheckDevice::NotRunYet() const {
    std::string rest;
    const auto add = [&](bool done, const char* what) {
        if (!done) rest += (rest.empty() ? " " : ", ") + std::string(what);
    };
    add(displaysChecked_, "CheckProgress");
    add(loaderChecked_, "CheckLoader");
    add(load_.Completed(), "a program load up to ResetSettings(2)");
    return rest;
}

}  // namespace hostcheck
