// corvane-flash program: plan, then erase, program and compare.

#include <fmt/format.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <limits>
#include <string>

#include "host/commands/Commands.h"
#include "host/driver/FlashDevice.h"
#include "host/facts/LoaderMemory.h"
#include "host/flashing/Comparison.h"
#include "host/flashing/DevicePlan.h"
#include "host/flashing/ImageSet.h"
#include "host/flashing/KeptBytes.h"
#include "host/flashing/ProgramPlan.h"
#include "host/output/Summary.h"
#include "host/settings/RangeSettings.h"

namespace host::commands {

namespace {

using plugin::ResetMode;

void Choose(Context& context, const char* key, const std::string& text) {
    context.settings.Set(Origin::CommandLine, key, text);
}

/// --erase necessary|none|all|A-B, as the plug-in's settings say it.
void ChooseErase(Context& context, FlashDevice& device, const std::string& choice) {
    if (choice == "necessary") return Choose(context, keys::kProgramOption, keys::kNecessaryPages);
    if (choice == "none") return Choose(context, keys::kProgramOption, keys::kNoErase);
    Choose(context, keys::kProgramOption, keys::kEraseOptions);
    const auto range = choice == "all" ? std::nullopt : std::optional(device.RangeInFlash(choice));
    SelectRange(context.settings, kEraseKeys, range);
}

void ApplyOptions(Context& context, FlashDevice& device) {
    const Options& options = context.options;
    if (options.erase) ChooseErase(context, device, *options.erase);
    if (options.crc) Choose(context, keys::kProgramCrc, "1");
    if (options.blankCheck) Choose(context, keys::kProgramBlankCheck, "1");
}

bool IsOn(const Context& context, const char* key) {
    return context.settings.Text(key).ends_with('1');
}

Json PlanJson(const ProgramPlan& plan) {
    Json sections = Json::array();
    for (const image::Section& section : plan.sections)
        sections.push_back({{"address", section.address}, {"bytes", section.bytes.size()}});
    Json erased = Json::array();
    for (const base::AddressRange& run : plan.erased)
        erased.push_back({{"address", run.first}, {"bytes", run.Size()}});
    return {{"sections", sections},
            {"erased", erased},
            {"sectors", plan.sectorCount},
            {"imageBytes", plan.imageBytes},
            {"unchangedBytes", plan.unchangedBytes},
            {"clearedBytes", plan.clearedBytes}};
}

void Expect(Context& context, WorkMeter& meter, const ProgramPlan& plan, std::uint64_t flashBytes) {
    meter.Expect(Phase::Erase, plan.erasedBytes);
    meter.Expect(Phase::Program, plan.transferBytes);
    if (IsOn(context, keys::kProgramBlankCheck))
        for (const image::Section& section : plan.sections)
            meter.Expect(Phase::BlankCheck, Widened({section.address, section.Last()}, 4).Size());
    if (IsOn(context, keys::kProgramCrc)) meter.Expect(Phase::Checksum, flashBytes);
    if (!context.options.noVerify) meter.Expect(Phase::Verify, plan.imageBytes);
}

/// The whole seconds that a text begins with; what the plug-in refuses is no time.
std::chrono::seconds Seconds(const std::string& text) {
    const auto number = std::strtoll(text.c_str(), nullptr, 10);
    return std::chrono::seconds(std::clamp<long long>(number, 0, std::numeric_limits<int>::max()));
}

/// The limit holds for each chunk, and for the plug-in's polls of a section together. So a fixed
/// default would fail large images on slow flash: each chunk may cost two polls more, unless the
/// user has set a limit.
void AllowTime(Context& context, FlashDevice& device, const ProgramPlan& plan) {
    constexpr std::uint64_t kChunksPerSecond = 5;
    const SettingValue limit = context.settings.Get(keys::kTimeout);
    device.LimitLastChunk(Seconds(limit.text));
    if (limit.origin != Origin::Default) return;
    const auto seconds =
        std::stoul(limit.text) + plan.transferBytes / (plugin::kChunkBytes * kChunksPerSecond);
    Choose(context, keys::kTimeout, std::to_string(seconds));
}

void WriteSections(Context& context, FlashDevice& device, const ProgramPlan& plan) {
    AllowTime(context, device, plan);
    if (plan.erasesWhole) ChooseErase(context, device, "all");
    device.ResetSettings(ResetMode::LoadBegins);
    for (const image::Section& section : plan.sections)
        device.WriteSection(section);
    const std::uint64_t erased = device.Meter().Of(Phase::Erase).doneBytes;
    if (erased < plan.erasedBytes)
        throw Failure(ExitStatus::DeviceFailed,
                      fmt::format("the plug-in erased {} of {} and gave no reason; {}",
                                  SizeText(erased), SizeText(plan.erasedBytes),
                                  device.Work().handedOver.Empty()
                                      ? "nothing was programmed"
                                      : "the image was programmed over what was there; try "
                                        "--erase necessary"));
}

void Load(Context& context, FlashDevice& device, const ProgramPlan& plan) {
    if (!plan.sections.empty()) WriteSections(context, device, plan);
    if (IsOn(context, keys::kProgramCrc)) device.ResetSettings(ResetMode::LoadComplete);
}

/// What can still be tried depends on what was erased.
std::string Advice(const Differences& differences, const ProgramPlan& plan) {
    if (!differences.notErased) return "these bytes were not programmed";
    const auto holdsIt = [&](const base::AddressRange& run) {
        return run.Contains(*differences.notErased);
    };
    if (std::any_of(plan.erased.begin(), plan.erased.end(), holdsIt))
        return "some bits stay 0 although their sectors were erased: the cells are worn out or "
               "protected";
    return "some bits were not erased first: program it with --erase necessary";
}

void ShowUnchanged(Reporter& reporter, const ProgramPlan& plan) {
    if (plan.unchangedBytes != 0 && reporter.Hears(Talk::Normal))
        reporter.Result(fmt::format("{:<13} {}", "Left alone", SizeText(plan.unchangedBytes)));
}

const char* DoneText(const ProgramPlan& plan, bool compared) {
    if (plan.sections.empty()) return "Done: the flash held the image already";
    return compared ? "Done: the flash holds the image"
                    : "Done: the image is programmed, but not compared";
}

Outcome LoadAndCompare(Context& context, FlashDevice& device, const LoadedImages& images,
                       const ProgramPlan& plan) {
    Expect(context, device.Meter(), plan, device.Info().flashBytes);
    Load(context, device, plan);
    Outcome outcome{.result = PlanJson(plan)};
    if (IsOn(context, keys::kProgramCrc))
        outcome.result["checksum"] = "0x" + device.Published(keys::kChecksumValue);
    if (!context.options.noVerify) {
        if (const auto differences = CompareWithFlash(device, images.image); !differences.Empty())
            FailAsDifferent(outcome, differences, images, Advice(differences, plan));
    }
    outcome.result["phases"] = PhasesJson(device.Meter());
    ShowSummary(context.reporter, device.Meter());
    ShowUnchanged(context.reporter, plan);
    if (context.options.run && outcome.status == ExitStatus::Done) device.StartProgram();
    if (outcome.status == ExitStatus::Done)
        context.reporter.Done(DoneText(plan, !context.options.noVerify));
    return outcome;
}

/// --keep: adds to the image what else its sectors hold. Returns how many bytes that is.
std::uint64_t KeepOthers(FlashDevice& device, LoadedImages& images, const EraseChoice& erase) {
    if (erase.kind == EraseChoice::Kind::Nothing) return 0;
    if (erase.kind != EraseChoice::Kind::Necessary)
        throw Failure(
            ExitStatus::WrongUsage,
            "--keep goes with --erase necessary: what all or a range is to erase can't be kept");
    const image::Image kept = KeptBytes(images.image, ReadSectors(device, images.image));
    images.Add(kept, "what the flash held");
    return kept.ByteCount();
}

void ShowPlan(Context& context, const ProgramPlan& plan, const FlashGeometry& flash) {
    for (const std::string& line : Describe(plan, flash)) {
        if (context.options.dryRun)
            context.reporter.Result(line);
        else
            context.reporter.Say(Talk::Verbose, line);
    }
}

Outcome ProgramOn(Context& context, FlashDevice& device, LoadedImages images) {
    RequireFit(device, images);
    ApplyOptions(context, device);
    const DeviceInfo& info = device.Info();
    const EraseChoice erase = ChosenErase(context.settings);
    const std::uint64_t kept = context.options.keep ? KeepOthers(device, images, erase) : 0;
    const ProgramPlan plan = PlanOnDevice(device, images.image, erase, context.options.rewrite);
    const std::string keeping =
        kept == 0 ? "" : fmt::format(" ({} of it kept from the flash)", SizeText(kept));
    context.reporter.Say(
        Talk::Normal, fmt::format("{}{} in {} for {}, {} of flash", SizeText(plan.imageBytes),
                                  keeping, CountText(plan.sections.size(), "section"), info.family,
                                  SizeText(info.flashBytes)));
    ShowPlan(context, plan, GeometryOf(device));
    Json planned = PlanJson(plan);
    planned["keptBytes"] = kept;
    if (context.options.dryRun) {
        planned["runs"] = ShowMap(context, device, images.image, plan);
        return NothingTouched(context, planned);
    }
    device.Know(planned);
    Outcome outcome = LoadAndCompare(context, device, images, plan);
    outcome.result["keptBytes"] = kept;
    return outcome;
}

void CheckEraseOption(const Options& options) {
    if (!options.erase || options.erase->find_first_of("-+") != std::string::npos) return;
    for (const char* word : {"necessary", "none", "all"})
        if (*options.erase == word) return;
    throw Failure(
        ExitStatus::WrongUsage,
        fmt::format("--erase takes necessary, none, all or a range A-B, not '{}'", *options.erase));
}

Outcome RunProgram(Context& context) {
    CheckEraseOption(context.options);
    LoadedImages images = ReadImages(context.options.files, ImageOptions(context.options));
    return WithDevice(context, [&](FlashDevice& device) {
        return ProgramOn(context, device, std::move(images));
    });
}

}  // namespace

CommandRow Program() {
    return {"program",
            "Program image files into flash and compare the result",
            "Files may be ELF, Intel HEX, S-record or, with --base, raw binary. Sectors that the "
            "image touches are erased whole, so what else they hold is lost, unless --keep keeps "
            "it (not when the load fails: 'read' makes a copy). Sectors that hold the image's "
            "bytes already are left alone.",
            "  corvane-flash program firmware.elf\n"
            "  corvane-flash program boot.hex app.srec --crc\n"
            "  corvane-flash program data.bin --base 0x8000 --erase none",
            {ImagesArgument(),
             FormatOption(),
             BaseOption(),
             {"--erase",
              "WHAT",
              "What is erased first: necessary (the image's sectors), none, all, or a range A-B",
              &Options::erase,
              Offers::SomeChoices,
              {"necessary", "none", "all"}},
             {"--keep", "",
              "Read what else the image's sectors hold, and program it back with the image",
              &Options::keep},
             {"--blank-check", "", "Check that the flash is blank before programming it",
              &Options::blankCheck},
             {"--crc", "", "Calculate the CRC-32 of the whole flash afterwards", &Options::crc},
             {"--rewrite", "", "Erase and program also what the flash holds already",
              &Options::rewrite},
             NoVerifyOption(),
             RunOption("Reset the device afterwards and let it run its program"),
             DryRunOption()},
            RunProgram};
}

}  // namespace host::commands
