// corvane-flash program: plan, then erase, program and compare.

#include <fmt/format.h>

#include <string>

#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/commands/SharedOptions.h"
#include "host/commands/WrittenRegisters.h"
#include "host/driver/FlashDevice.h"
#include "host/flashing/DeviceGeometry.h"
#include "host/flashing/FlashMap.h"
#include "host/flashing/Forecast.h"
#include "host/flashing/ImageSet.h"
#include "host/flashing/KeptBytes.h"
#include "host/flashing/Load.h"
#include "host/flashing/ProgramSettings.h"
#include "host/output/Summary.h"

namespace host::commands {

namespace {

struct ProgramOptions : ImageFiles,
                        Comparing,
                        ComparisonKind,
                        Running,
                        DryRun,
                        RegisterOptionsOfLoad {
    std::optional<std::string> erase;
    bool keep = false;
    bool blankCheck = false;
    bool crc = false;
    bool rewrite = false;
};

/// --erase necessary|none|all|A-B.
EraseChoice ChosenErase(FlashDevice& device, const std::string& choice) {
    using Kind = EraseChoice::Kind;
    if (choice == "necessary") return {Kind::Necessary};
    if (choice == "none") return {Kind::Nothing};
    if (choice == "all") return {Kind::Everything};
    return {Kind::Range, device.RangeInFlash(choice)};
}

/// What the settings ask for, unless an option says it otherwise.
LoadRequest Request(const SettingStore& settings, const ProgramOptions& options,
                    FlashDevice& device) {
    LoadRequest request = RequestedLoad(settings);
    if (options.erase) request.erase = ChosenErase(device, *options.erase);
    request.checks.checksum = request.checks.checksum || options.crc;
    request.checks.blankCheck = request.checks.blankCheck || options.blankCheck;
    request.checks.compare = !options.noVerify;
    request.rewrite = options.rewrite;
    return request;
}

/// --keep: adds to the image what else its sectors hold. Returns how many bytes that is.
std::uint64_t KeepOthers(FlashDevice& device, LoadedImages& images, const EraseChoice& erase) {
    if (erase.kind == EraseChoice::Kind::Nothing)
        throw Failure(ExitStatus::WrongUsage,
                      "--keep goes with --erase necessary: where nothing is erased, nothing is to "
                      "be kept");
    if (erase.kind != EraseChoice::Kind::Necessary)
        throw Failure(
            ExitStatus::WrongUsage,
            "--keep goes with --erase necessary: what all or a range is to erase can't be kept");
    const image::Image kept =
        ReadKeptBytes(device, device.Meter(), images.image, GeometryOf(device.Info()));
    images.Add(kept, "what the flash held");
    return kept.ByteCount();
}

void ShowPlan(Context& context, const DeviceInfo& info, const LoadPlan& plan, std::uint64_t kept,
              const WantedRegisters& registers) {
    const std::string keeping =
        kept == 0 ? "" : fmt::format(" ({} of it kept from the flash)", SizeText(kept));
    const std::string sections =
        plan.sections.empty() ? "" : " in " + CountText(plan.sections.size(), "section");
    context.reporter.Say(Verbosity::Normal,
                         fmt::format("{}{}{} for {}, {} of flash", SizeText(plan.imageBytes),
                                     keeping, sections, info.family, SizeText(info.flashBytes)));
    std::vector<std::string> lines = Describe(plan, GeometryOf(info));
    for (const std::string& text : Describe(registers))
        lines.push_back(fmt::format("{:<8} {}", "program", text));
    for (const std::string& line : lines) {
        if (context.isDryRun)
            context.reporter.Result(line);
        else
            context.reporter.Say(Verbosity::Verbose, line);
    }
}

void ShowUnchanged(Reporter& reporter, const LoadPlan& plan) {
    if (plan.unchangedBytes != 0 && reporter.Hears(Verbosity::Normal))
        reporter.Result(fmt::format("{:<13} {}{}", "Left alone", SizeText(plan.unchangedBytes),
                                    ByChecksumText(plan.lookedByChecksum)));
}

std::string DoneText(const LoadPlan& plan, bool comparedByChecksum) {
    if (plan.sections.empty())
        return std::string("Done: the flash held the image already") +
               ByChecksumText(plan.checks.compare ? comparedByChecksum : plan.lookedByChecksum);
    if (!plan.checks.compare) return "Done: the image is programmed, but not compared";
    return std::string("Done: the flash holds the image") + ByChecksumText(comparedByChecksum);
}

Outcome Load(Context& context, FlashDevice& device, const LoadedImages& images,
             const LoadPlan& plan, const WantedRegisters& registers, bool runAfterwards) {
    const LoadResult load = RunLoad(device, plan, images.image);
    Outcome outcome{.result = ToJson(plan)};
    if (load.checksum) outcome.result["checksum"] = *load.checksum;
    if (plan.checks.compare) outcome.result["comparedBy"] = ComparedBy(load.differences);
    if (!load.differences.Empty())
        FailAsDifferent(outcome, load.differences, images, AdviceAfter(plan, load.differences));
    outcome.result["phases"] = PhasesJson(device.Meter().Phases());
    ShowSummary(context.reporter, device.Meter().Phases());
    ShowUnchanged(context.reporter, plan);
    if (outcome.status == ExitStatus::Done) WriteAfterLoad(context, device, registers, outcome);
    if (outcome.status != ExitStatus::Done) return outcome;
    if (runAfterwards) device.StartProgram();
    outcome.done = DoneText(plan, load.differences.byChecksum);
    return outcome;
}

/// Ends as the load would, as far as that can be known.
Outcome DryRunOf(Context& context, FlashDevice& device, const LoadedImages& images,
                 const LoadPlan& plan, Json planned) {
    if (!plan.sections.empty()) device.RequireLoader();
    const FlashGeometry flash = GeometryOf(device.Info());
    const std::vector<std::uint8_t> contents = ReadAll(device, device.Meter(), flash);
    planned["runs"] = ShowMap(context.reporter, contents, flash, images.image, plan);
    Outcome outcome = NothingTouched(context, std::move(planned));
    const Forecast forecast = ForecastLoad(plan, images.image, contents);
    if (forecast.notBlank)
        FailAsNotBlank(outcome, *forecast.notBlank);
    else if (!forecast.differences.Empty())
        FailAsForecast(outcome, forecast.differences, images,
                       AdviceAfter(plan, forecast.differences));
    return outcome;
}

Outcome ProgramOn(Context& context, FlashDevice& device, const ProgramOptions& options,
                  const WantedRegisters& registers, LoadedImages images) {
    const DeviceInfo& info = device.Info();
    RequireFit(device, info, images);
    ApplyTo(device, options);
    if (options.dryRun) device.CompareBytes();  // trying the target's checksum writes to RAM
    const LoadRequest request = Request(context.settings, options, device);
    const std::uint64_t kept = options.keep ? KeepOthers(device, images, request.erase) : 0;
    const LoadPlan plan = PlanOnDevice(device, request, images.image);
    ShowPlan(context, info, plan, kept, registers);
    Json planned = ToJson(plan);
    planned["keptBytes"] = kept;
    if (context.isDryRun) return DryRunOf(context, device, images, plan, planned);
    device.AddToFailures(planned);
    Outcome outcome = Load(context, device, images, plan, registers, options.run);
    outcome.result["keptBytes"] = kept;
    return outcome;
}

void CheckEraseOption(const ProgramOptions& options) {
    if (!options.erase || options.erase->find_first_of("-+") != std::string::npos) return;
    for (const char* word : {"necessary", "none", "all"})
        if (*options.erase == word) return;
    throw Failure(
        ExitStatus::WrongUsage,
        fmt::format("--erase takes necessary, none, all or a range A-B, not '{}'", *options.erase));
}

Outcome RunProgram(Context& context, const ProgramOptions& options) {
    CheckEraseOption(options);
    const WantedRegisters registers = RequireRegisters(options);
    if (options.run && !registers.Empty() && !registers.commit)
        throw Failure(ExitStatus::WrongUsage,
                      "--run resets the device, which forgets a register that isn't committed; add "
                      "--commit");
    context.isDryRun = options.dryRun;
    LoadedImages images = ReadNamed(context, options.files, options);
    return WithDevice(context, [&](FlashDevice& device) {
        return ProgramOn(context, device, options, registers, std::move(images));
    });
}

}  // namespace

CommandRow Program() {
    return Command<ProgramOptions>(
        {.name = "program",
         .help = "Program image files into flash and compare the result",
         .details = "Files may be ELF, Intel HEX, S-record or, with --base, raw binary. Sectors "
                    "that the image touches are erased whole, so what else they hold is lost, "
                    "unless --keep keeps it (not when the load fails: 'read' makes a copy). "
                    "Sectors that hold the image's bytes already are left alone.",
         .example = "  corvane-flash program firmware.elf\n"
                    "  corvane-flash program boot.hex app.srec --crc\n"
                    "  corvane-flash program fw.elf --mac 02-1b-c3-04-05-06 --commit\n"
                    "  corvane-flash program data.bin --base 0x8000 --erase none"},
        {ImagesArgument(true),
         FormatOption(),
         BaseOption(),
         {&ProgramOptions::erase,
          {"--erase",
           "WHAT",
           "What is erased first: necessary (the image's sectors), none, all, or a range A-B",
           Offers::SomeChoices,
           {"necessary", "none", "all"}}},
         {&ProgramOptions::keep,
          {"--keep", "",
           "Read what else the image's sectors hold, and program it back with the image"}},
         {&ProgramOptions::blankCheck,
          {"--blank-check", "", "Check that the flash is blank before programming it"}},
         {&ProgramOptions::crc,
          {"--crc", "", "Calculate the CRC-32 of the whole flash afterwards"}},
         {&ProgramOptions::rewrite,
          {"--rewrite", "", "Erase and program also what the flash holds already"}},
         {&RegisterOptionsOfLoad::mac,
          {"--mac", "ADDRESS", "Program this MAC address after the flash"}},
         {&RegisterOptionsOfLoad::registers,
          {"--register", "INDEX=VALUE",
           "Program a user register after the flash, hexadecimal; for both, give it twice"}},
         CommitOption(),
         AnyAddressOption(),
         NoVerifyOption(),
         CompareOption(),
         RunOption("Reset the device afterwards and let it run its program"),
         DryRunOption()},
        RunProgram);
}

}  // namespace host::commands
