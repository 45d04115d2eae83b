// The table of the checks, and what is made of their outcomes.

#include "host/checks/Checks.h"

#include <fmt/format.h>

#include <memory>
#include <utility>

#include "host/base/Errors.h"
#include "host/base/Interrupt.h"
#include "host/base/Text.h"
#include "host/checks/CheckTable.h"
#include "host/facts/FlashMemory.h"
#include "host/targets/ExpectedDevice.h"

namespace host {

namespace {

struct CheckRow {
    const char* name;
    const char* means;  ///< when it doesn't pass
    const char* helps;  ///< the same; null: as the server's profile has it
    std::string (*make)(CheckSubject& subject) = nullptr;
};

constexpr CheckRow kAttach{
    "attach",
    "no target is there to be worked on, halted",
    "--gdb HOST:PORT; --gdb-option server=NAME, init=COMMAND, attach=NUMBER, timeout=TIME",
};

constexpr CheckRow kIdentification{
    "identification",
    "it isn't a device of this family, is locked, or has no power",
    "the server's own options for the part; --gdb-option attach=NUMBER where it has several "
    "targets",
};

constexpr CheckRow kChecks[] = {
    {"failed reads", "of a board that is lost, zeros would be told as its contents", nullptr,
     CheckFailedReads},
    {"registers", "the flash controller takes 32-bit accesses only, and can't be driven",
     "a server that makes single accesses of four aligned bytes; --gdb-option server=NAME",
     CheckRegisters},
    {"half registers", "nothing for a load, whose registers are all 32 bits wide",
     "nothing need be done", CheckHalfRegisters},
    {"packets", "a load takes longer than it need", "a server that takes longer packets",
     CheckPackets},
    {"loader", "there is no program that the target could write its flash with",
     "--loader FILE; --gdb-option ram-end=ADDRESS", CheckLoader},
    {"memory", "chunks of an image would arrive damaged, or change what lies beside them",
     "--gdb-option writes=hex; is this the part that the server was started for, and does it cache "
     "memory?",
     CheckMemory},
    {"delay", "each exchange with the target costs so much, and a chunk takes several",
     "a nearer server, or a shorter latency timer of the probe's driver", CheckDelay},
    {"rate", "how long an image takes isn't known", "see above", CheckRate},
    {"checksum", "a comparison takes as long as reading, or tells what isn't so",
     "a server that has qCRC; --compare bytes", CheckChecksum},
    {"reset", "a load would begin with a target in whatever state it is",
     "--gdb-option reset=COMMAND, a monitor command that resets and halts it, or reset=packet:vRun",
     CheckReset},
    {"run", "the loader wouldn't program anything, or nobody would know when it is done",
     "the loader of this family with --loader FILE; --gdb-option ram-end=ADDRESS, pc=NUMBER, "
     "sp=NUMBER, live=no",
     CheckRun},
};

constexpr CheckRow kPutBack{
    "put back",
    "the RAM holds what the checks wrote",
    "reset the board before its program goes on",
    PutBack,
};

constexpr char kTrustReads[] = "reads=trusted";

bool TrustsReads(const TargetOptions& options) {
    const auto trusts = [](const std::string& text) { return text.find(kTrustReads) != text.npos; };
    return std::ranges::any_of(options.gdbOptions, trusts);
}

std::string Identity(const DeviceInfo& info) {
    return fmt::format("{}, {:#010x}: {} of flash, {} of RAM", info.family, info.identification,
                       SizeText(info.flashBytes), SizeText(info.ramBytes));
}

class Run {
  public:
    Run(const DeviceOptions& options, SettingStore& settings, Reporter& reporter,
        const std::function<void(const Finding&)>& show)
        : options_(options), settings_(settings), reporter_(reporter), show_(show) {}

    CheckReport All();

  private:
    void Make(const CheckRow& row, const std::function<std::string()>& check);
    void MakeChecks(OpenTarget& opened);
    std::string Attach(std::unique_ptr<OpenTarget>& opened);
    void NoteFailure(Finding& finding, const std::string& text);
    bool StillAnswers();

    const DeviceOptions& options_;
    SettingStore& settings_;
    Reporter& reporter_;
    const std::function<void(const Finding&)>& show_;
    std::optional<FlashDevice> device_;
    OpenTarget* opened_ = nullptr;  ///< the device's, once it is there
    bool lost_ = false;             ///< it doesn't answer any more
    CheckReport report_;
};

CheckReport Run::All() {
    std::unique_ptr<OpenTarget> opened;
    Make(kAttach, [&] { return Attach(opened); });
    OpenTarget* target = opened.get();
    Make(kIdentification, [&] {
        if (target == nullptr) throw CheckNotMade("there is no target");
        device_.emplace(std::move(opened), options_, settings_, reporter_);
        device_->RequireFlash();
        const DeviceInfo& info = device_->Info();
        if (const auto& expected = options_.target.expect)
            RequireExpected(ParseExpectedDevice(*expected), info.family, info.flashBytes);
        opened_ = target;
        return Identity(info);
    });
    if (opened_ != nullptr) {
        MakeChecks(*opened_);
    } else {
        for (const CheckRow& row : kChecks)
            Make(row, []() -> std::string { throw CheckNotMade("there is no device"); });
    }
    if (device_) device_->Close(DeviceFile::LeaveAlone);
    return std::move(report_);
}

/// A server that hides failed reads is found out by a check of its own.
std::string Run::Attach(std::unique_ptr<OpenTarget>& opened) {
    DeviceOptions options = options_;
    if (options.target.gdb) options.target.gdbOptions.emplace_back(kTrustReads);
    opened = Open(options, reporter_);
    const auto server = opened->Server();
    return (server ? server->name : "a simulated device") + ", halted";
}

void Run::MakeChecks(OpenTarget& opened) {
    CheckSubject subject{opened, device_->Info(), TrustsReads(options_.target)};
    try {
        for (const CheckRow& row : kChecks)
            Make(row, [&] {
                if (lost_) throw CheckNotMade("the device doesn't answer any more");
                return row.make(subject);
            });
    } catch (...) {
        try {
            PutBack(subject);
            device_->Close(DeviceFile::LeaveAlone);
        } catch (const std::exception& error) {
            reporter_.Error(fmt::format("{}: {}", kPutBack.means, error.what()));
        }
        throw;
    }
    Make(kPutBack, [&] { return PutBack(subject); });
    report_.speed = subject.speed;
}

void Run::Make(const CheckRow& row, const std::function<std::string()>& check) {
    Finding finding{.name = row.name};
    try {
        finding.text = check();
        // Where failed reads are hidden, a check may have passed because of that.
        if (opened_ != nullptr && !StillAnswers())
            NoteFailure(finding, "the device doesn't answer as before");
    } catch (const CheckNoted& note) {
        finding.verdict = Verdict::Noted;
        finding.text = note.what();
    } catch (const CheckNotMade& reason) {
        finding.verdict = Verdict::NotMade;
        finding.text = reason.what();
    } catch (const Failure& failure) {
        if (failure.Status() == ExitStatus::WrongUsage || Interrupted()) throw;
        NoteFailure(finding, failure.what());
    } catch (const std::runtime_error& error) {
        NoteFailure(finding, error.what());
    }
    if (finding.verdict == Verdict::Noted || finding.verdict == Verdict::Failed) {
        finding.means = row.means;
        const auto server = opened_ != nullptr ? opened_->Server() : std::nullopt;
        if (row.helps != nullptr)
            finding.helps = row.helps;
        else if (server)
            finding.helps = server->reportsReads + "; or --gdb-option reads=trusted";
    }
    report_.findings.push_back(finding);
    show_(finding);
}

void Run::NoteFailure(Finding& finding, const std::string& text) {
    if (Interrupted()) throw Failure(ExitStatus::Interrupted, "interrupted");
    finding.verdict = Verdict::Failed;
    finding.text = text;
    lost_ = lost_ || (opened_ != nullptr && !StillAnswers());
}

bool Run::StillAnswers() try {
    std::uint32_t now = 0;
    opened_->Get().Read(&now, 1, plugin::kIdentificationRegister, plugin::kRamPage, sizeof now);
    return now == device_->Info().identification;
} catch (const target::TargetError&) {
    return false;
}

}  // namespace

CheckReport CheckTarget(const DeviceOptions& options, SettingStore& settings, Reporter& reporter,
                        const std::function<void(const Finding&)>& show) {
    return Run(options, settings, reporter, show).All();
}

}  // namespace host
