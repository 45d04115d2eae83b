// corvane-flash check: whether target, server and loader are what a load needs.

#include <fmt/format.h>
#include <fmt/ranges.h>

#include "host/checks/Checks.h"
#include "host/commands/Command.h"
#include "host/commands/Commands.h"

namespace host::commands {

namespace {

struct VerdictText {
    const char* mark;  ///< for people
    const char* id;    ///< in JSON
};

VerdictText TextOf(Verdict verdict) {
    switch (verdict) {
        case Verdict::Passed:
            return {"ok", "passed"};
        case Verdict::Noted:
            return {"note", "noted"};
        case Verdict::Failed:
            return {"FAIL", "failed"};
        case Verdict::NotMade:
            break;
    }
    return {"-", "not made"};
}

void Show(Reporter& reporter, const Finding& finding) {
    reporter.Result(
        fmt::format("{:<5} {:<15} {}", TextOf(finding.verdict).mark, finding.name, finding.text));
    if (!finding.means.empty()) reporter.Result(fmt::format("{:21} means: {}", "", finding.means));
    if (!finding.helps.empty()) reporter.Result(fmt::format("{:21} helps: {}", "", finding.helps));
}

Json FindingJson(const Finding& finding) {
    Json json{
        {"name", finding.name}, {"verdict", TextOf(finding.verdict).id}, {"text", finding.text}};
    if (!finding.means.empty()) json["means"] = finding.means;
    if (!finding.helps.empty()) json["helps"] = finding.helps;
    return json;
}

Json SpreadJson(const std::optional<Spread>& spread) {
    if (!spread) return nullptr;
    return {{"minimum", spread->minimum}, {"median", spread->median}, {"maximum", spread->maximum}};
}

Outcome OutcomeOf(const CheckReport& report) {
    std::vector<std::string> failed;
    Json checks = Json::array();
    for (const Finding& finding : report.findings) {
        checks.push_back(FindingJson(finding));
        if (finding.verdict == Verdict::Failed) failed.emplace_back(finding.name);
    }
    const LinkSpeed& speed = report.speed;
    Outcome outcome{.result = {{"checks", std::move(checks)},
                               {"delaySeconds", SpreadJson(speed.delaySeconds)},
                               {"readBytesPerSecond", SpreadJson(speed.readBytesPerSecond)},
                               {"writeBytesPerSecond", SpreadJson(speed.writeBytesPerSecond)},
                               {"live", speed.live ? Json(*speed.live) : Json(nullptr)}}};
    if (failed.empty()) return outcome;
    outcome.status = ExitStatus::Unreachable;
    outcome.error =
        fmt::format("a load can't work: {} failed: {}",
                    failed.size() == 1 ? "a check" : "these checks", fmt::join(failed, ", "));
    return outcome;
}

/// --wait: what is wrong with a board that doesn't come is told by the checks.
void AwaitBoard(Context& context) try {
    if (context.options.wait) WithDevice(context, [](FlashDevice&) { return Outcome(); });
} catch (const Failure& failure) {
    if (failure.Status() != ExitStatus::Unreachable) throw;
}

Outcome RunCheck(Context& context, const NoOptions& /*options*/) {
    AwaitBoard(context);
    return WithTrace(context, [&](Trace* trace) {
        const DeviceOptions options{TargetOf(context.options), context.options.plugin, trace};
        const CheckReport report =
            CheckTarget(options, context.settings, context.reporter,
                        [&](const Finding& finding) { Show(context.reporter, finding); });
        Outcome outcome = OutcomeOf(report);
        if (outcome.status == ExitStatus::Done)
            context.reporter.Done("Done: a load can work; no flash was touched");
        return outcome;
    });
}

}  // namespace

CommandRow Check() {
    return Command<NoOptions>(
        {.name = "check",
         .help = "Try what a load needs, before anything is erased",
         .details = "A line for each check; below one that fails stands what it means and what "
                    "helps. RAM is written and put back, and the device is reset and left halted: "
                    "a user register that isn't committed loses its value. The exit status is 4 "
                    "when a load can't work. Of a simulated device, what concerns servers isn't "
                    "checked.",
         .example = "  corvane-flash --gdb :3333 --loader FlashLoaderMerrow.out check"},
        {}, RunCheck);
}

}  // namespace host::commands
