// From the options to a server, and from its lent probe to a device.

#include "host/flashing/ProbeServing.h"

#include <utility>

#include "base/system/Environment.h"
#include "host/base/Interrupt.h"
#include "host/flashing/DebuggerLoad.h"
#include "host/targets/Listening.h"

namespace host {

namespace gdb = target::gdb;

ProbeServing::ProbeServing(const DeviceOptions& options, const std::string& address,
                           const SettingStore& settings, Reporter& reporter)
    : options_(options),
      settings_(settings),
      reporter_(reporter),
      connector_(options.target, LinesTo(options.trace)),
      address_(ListenAddress(address)) {
    const PluginLibrary isThere(options_.plugin.value_or(""));
    try {
        server_ = std::make_unique<gdb::ProbeServer>(
            [this] { return connector_.Connect(); },
            [this](gdb::GdbTarget& probe) { return OpenFlash(probe); }, address_, Interrupted,
            [this](const std::string& text) { reporter_.Error(text); });
    } catch (const gdb::SocketError& error) {
        FailToListen(address_, error);
    }
    address_.port = std::to_string(server_->Port());
}

std::unique_ptr<gdb::FlashProgrammer> ProbeServing::OpenFlash(gdb::GdbTarget& probe) const {
    return std::make_unique<DebuggerLoad>(
        [this, &probe](SettingStore& settings) {
            return std::make_unique<FlashDevice>(std::make_unique<GdbServerTarget>(probe), options_,
                                                 settings, reporter_);
        },
        [&probe] { return LoaderMemory(probe, base::ExecutableDirectory()); }, settings_);
}

}  // namespace host
