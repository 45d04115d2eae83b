// corvane-flash map: what the flash holds, and what images would do to it.

#include "host/commands/Commands.h"
#include "host/driver/FlashDevice.h"
#include "host/flashing/DevicePlan.h"
#include "host/flashing/FlashMap.h"
#include "host/flashing/ImageSet.h"

namespace host::commands {

namespace {

Outcome MapOn(Context& context, FlashDevice& device, const LoadedImages& images) {
    device.RequireFlash();
    RequireFit(device, images);
    const DeviceInfo& info = device.Info();
    ProgramPlan plan;
    if (!images.image.Empty())
        plan = PlanOnDevice(device, images.image, ChosenErase(context.settings), false);
    Json runs = ShowMap(context, device, images.image, plan);
    return {.result = {{"flashBytes", info.flashBytes},
                       {"sectorBytes", info.sectorBytes},
                       {"runs", std::move(runs)}}};
}

Outcome RunMap(Context& context) {
    const LoadedImages images = ReadImages(context.options.files, ImageOptions(context.options));
    return WithDevice(context, [&](FlashDevice& device) { return MapOn(context, device, images); });
}

}  // namespace

Json ShowMap(Context& context, FlashDevice& device, const image::Image& image,
             const ProgramPlan& plan) {
    const DeviceInfo& info = device.Info();
    const FlashGeometry flash = GeometryOf(device);
    device.Halt();
    device.Meter().Expect(Phase::Read, info.flashBytes);
    device.Meter().Begin(Phase::Read);
    const auto contents = device.ReadFlash(info.Flash());
    device.Meter().End();
    const std::vector<MapRun> runs = MapFlash(contents, flash, image, plan);
    for (const std::string& line : DrawMap(runs, flash, context.reporter.Columns()))
        context.reporter.Result(line);
    return ToJson(runs);
}

CommandRow Map() {
    OptionRow images = ImagesArgument();
    images.required = false;
    return {"map",
            "Draw what the flash holds, and what images would change",
            "The flash is read, and nothing is touched. With image files, the map shows what "
            "'program' would do with them.",
            "  corvane-flash map\n"
            "  corvane-flash map firmware.elf",
            {images, FormatOption(), BaseOption()},
            RunMap};
}

}  // namespace host::commands
