// corvane-flash map: what the flash holds, and what images would do to it.

#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/commands/SharedOptions.h"
#include "host/driver/FlashDevice.h"
#include "host/flashing/DeviceGeometry.h"
#include "host/flashing/FlashMap.h"
#include "host/flashing/ImageSet.h"
#include "host/flashing/Load.h"
#include "host/flashing/ProgramSettings.h"

namespace host::commands {

namespace {

Outcome MapOn(Context& context, FlashDevice& device, const LoadedImages& images) {
    device.RequireFlash();
    RequireFit(device, device.Info(), images);
    const DeviceInfo& info = device.Info();
    LoadPlan plan;
    device.CompareBytes();  // trying the target's checksum writes to RAM
    if (!images.image.Empty())
        plan = PlanOnDevice(device, RequestedLoad(context.settings), images.image);
    const FlashGeometry flash = GeometryOf(info);
    Json runs = ShowMap(context.reporter, ReadAll(device, device.Meter(), flash), flash,
                        images.image, plan);
    return {.result = {{"flashBytes", info.flashBytes},
                       {"sectorBytes", info.sectorBytes},
                       {"runs", std::move(runs)}}};
}

Outcome RunMap(Context& context, const ImageFiles& options) {
    const LoadedImages images = ReadNamed(context, options.files, options);
    return WithDevice(context, [&](FlashDevice& device) { return MapOn(context, device, images); });
}

}  // namespace

CommandRow Map() {
    return Command<ImageFiles>(
        {.name = "map",
         .help = "Draw what the flash holds, and what images would change",
         .details = "The flash is read, and nothing is changed; a board is left halted. With image "
                    "files, the map shows what 'program' would do with them.",
         .example = "  corvane-flash map\n"
                    "  corvane-flash map firmware.elf"},
        {ImagesArgument(false), FormatOption(), BaseOption()}, RunMap);
}

}  // namespace host::commands
