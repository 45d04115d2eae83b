// Here is how checks are run and told; the calls are in HostCalls.cpp.

#include "hostcheck/HostCheckDevice.h"

namespace hostcheck {

HostCheckDevice::HostCheckDevice(const char* variant, const char* text2, const char* text3,
                                 IFlashHost* host)
    : host_(host) {
    Require(variant != nullptr && text2 != nullptr && text3 != nullptr, "CreateFlashDevice2",
            "three texts", "null");
    Examine(Stage::Creation);
}

void HostCheckDevice::Examine(Stage stage) {
    for (const auto& table : {SettingChecks(), TargetChecks(), MemoryChecks(), DisplayChecks()}) {
        for (const Check& check : table) {
            if (check.stage != stage) continue;
            const std::string slot = std::string(check.slot) + ": ";
            try {
                const std::string remark = check.run(host_);
                Note(true, slot + "ok: " + check.expected + (remark.empty() ? "" : "; " + remark));
            } catch (const Breach& breach) {
                Note(false, slot + "expected " + check.expected + "; came " + breach.what());
            } catch (const NotChecked& reason) {
                Note(true, slot + "not checked: " + check.expected + "; " + reason.what());
            }
        }
    }
}

void HostCheckDevice::Note(bool holds, std::string text) {
    findings_.push_back({holds, std::move(text)});
}

void HostCheckDevice::Require(bool holds, const char* call, const char* expected,
                              const std::string& came) {
    if (!holds) Note(false, std::string(call) + ": expected " + expected + "; came " + came);
}

void HostCheckDevice::Tell(const char* call) {
    Require(!calledWhileBusy_.exchange(false), call, "no other call before this one has returned",
            "one, from a slot or from another thread");
    const std::vector<Finding> findings = std::exchange(findings_, {});
    std::size_t held = 0;
    for (const Finding& finding : findings) {
        Show(finding);
        if (finding.holds) ++held;
    }
    if (!findings.empty())
        Show({true, std::string("Host check, ") + call + ": " + std::to_string(held) + " of " +
                        std::to_string(findings.size()) + " hold"});
}

// What ShowMessage won't take is shown as an error; what ShowError won't take is returned.
void HostCheckDevice::Show(const Finding& finding) {
    std::string text = finding.text;
    if (finding.holds) {
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
