// Here is how checks are run and told; the calls are in HostCalls.cpp.

#include "hostcheck/HostCheckDevice.h"

#include <algorithm>

namespace hostcheck {

HostCheckDevice::HostCheckDevice(const char* variant, const char* text2, const char* text3,
                                 IFlashHost* host)
    : host_(host) {
    Require(variant != nullptr && text2 != nullptr && text3 != nullptr, "CreateFlashDevice2",
            "three texts", "null");
    Examine(Stage::Creation);
}

// Memory comes before halts: a plug-in begins with a read from the target as it was found.
void HostCheckDevice::Examine(Stage stage) {
    for (const auto& table : {SettingChecks(), MemoryChecks(), TargetChecks(), DisplayChecks()}) {
        for (const Check& check : table) {
            if (check.stage != stage) continue;
            const std::string slot = std::string(check.slot) + ": ";
            try {
                const std::string remark = check.run(host_);
                Note(Verdict::Holds,
                     slot + "ok: " + check.expected + (remark.empty() ? "" : "; " + remark));
            } catch (const Breach& breach) {
                Note(Verdict::Fails,
                     slot + "expected " + check.expected + "; came " + breach.what());
            } catch (const NotChecked& reason) {
                Note(Verdict::NotChecked,
                     slot + "not checked: " + check.expected + "; " + reason.what());
            }
        }
    }
}

void HostCheckDevice::Note(Verdict verdict, std::string text) {
    findings_.push_back({verdict, std::move(text)});
}

void HostCheckDevice::Require(bool holds, const char* call, const char* expected,
                              const std::string& came) {
    if (!holds)
        Note(Verdict::Fails, std::string(call) + ": expected " + expected + "; came " + came);
}

void HostCheckDevice::Tell(const char* call) {
    Require(!calledWhileBusy_.exchange(false), call, "no other call before this one has returned",
            "one, from a slot or from another thread");
    const std::vector<Finding> findings = std::exchange(findings_, {});
    if (findings.empty()) return;
    const auto count = [&](Verdict verdict) {
        return std::ranges::count(findings, verdict, &Finding::verdict);
    };
    const auto held = count(Verdict::Holds);
    const auto unchecked = count(Verdict::NotChecked);
    for (const Finding& finding : findings)
        Show(finding);
    Show({Verdict::Holds,
          std::string("Host check, ") + call + ": " + std::to_string(held) + " of " +
              std::to_string(held + count(Verdict::Fails)) + " hold" +
              (unchecked == 0 ? "" : ", " + std::to_string(unchecked) + " not checked")});
}

// What ShowMessage won't take is shown as an error; what ShowError won't take is returned.
void HostCheckDevice::Show(const Finding& finding) {
    std::string text = finding.text;
    if (finding.verdict != Verdict::Fails) {
        try {
            host_.Do([&](IFlashHost& host) { return host.ShowMessage(text.c_str()); });
            return;
        } catch (const Breach& breach) {
            text = "ShowMessage: expected null for " + Quoted(text) + "; came " + breach.what();
        }
    }
    try {
        host_.Do([&](IFlashHost& host) { return host.ShowError(text.c_str()); });
    } catch (const Breach& breach) {
        throw std::runtime_error("ShowError: expected null for " + Quoted(text) + "; came " +
                                 breach.what());
    }
}

}  // namespace hostcheck
