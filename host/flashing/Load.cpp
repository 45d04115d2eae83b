// The steps of a load, in their order.

#include "host/flashing/Load.h"

#include <fmt/format.h>

#include <algorithm>

#include "host/driver/FlashDevice.h"
#include "host/facts/SettingKeys.h"
#include "host/flashing/DeviceGeometry.h"
#include "host/flashing/ImageChecksum.h"
#include "host/flashing/ProgramSettings.h"
#include "host/flashing/Unchanged.h"

namespace host {

namespace {

/// The plug-in goes on after an erase that did nothing.
void RequireErased(FlashDevice& device, const LoadPlan& plan) {
    const std::uint64_t erased = device.Meter().Phases()[Phase::Erase].doneBytes;
    if (erased >= plan.erasedBytes) return;
    throw Failure(ExitStatus::DeviceFailed,
                  fmt::format("the plug-in erased {} of {} and gave no reason; {}",
                              SizeText(erased), SizeText(plan.erasedBytes),
                              device.Work().handedOver.Empty()
                                  ? "nothing was programmed"
                                  : "the image was programmed over what was there; try "
                                    "--erase necessary"));
}

void WriteSections(FlashDevice& device, const LoadPlan& plan) {
    device.LimitLastChunk(plan.chunkTime);
    device.ResetSettings(plugin::ResetMode::LoadBegins);
    for (const image::Section& section : plan.sections)
        device.WriteSection(section);
    RequireErased(device, plan);
}

}  // namespace

LoadPlan PlanOnDevice(FlashDevice& device, const LoadRequest& request, const image::Image& image) {
    RequireErasable(device.Info(), request.erase);
    const FlashGeometry flash = GeometryOf(device.Info());
    const bool look = request.erase.kind == EraseChoice::Kind::Necessary && !request.rewrite;
    const FlashNow now = look ? ReadForPlan(device, device.Meter(), image, flash) : FlashNow{};
    LoadPlan plan = PlanLoad(request, image, now.contents, flash);
    plan.lookedByChecksum = now.byChecksum;
    return plan;
}

LoadResult RunLoad(FlashDevice& device, const LoadPlan& plan, const image::Image& image) {
    ExpectLoad(device.Meter(), plan, GeometryOf(device.Info()));
    WriteProgramSettings(device.Settings(), plan);
    if (!plan.sections.empty()) WriteSections(device, plan);
    LoadResult result;
    if (plan.checks.checksum) {
        device.ResetSettings(plugin::ResetMode::LoadComplete);
        result.checksum = ChecksumText(device.Published(keys::kChecksumValue));
    }
    if (plan.checks.compare) result.differences = CompareWithFlash(device, device.Meter(), image);
    return result;
}

std::string AdviceAfter(const LoadPlan& plan, const Differences& differences) {
    if (!differences.notErased) return "these bytes were not programmed";
    const auto holdsIt = [&](const base::AddressRange& run) {
        return run.Contains(*differences.notErased);
    };
    if (std::any_of(plan.erased.begin(), plan.erased.end(), holdsIt))
        return "some bits stay 0 although their sectors were erased: the cells are worn out or "
               "protected";
    return "some bits were not erased first: program it with --erase necessary";
}

}  // namespace host
