// A host over a simulated device, with what it says on standard error kept off the screen.

#pragma once

#include "host/driver/FlashHost.h"
#include "target/simulated/SimulatedDevice.h"

namespace host {

struct HostUnderTest {
    explicit HostUnderTest(const std::string& device = "tolva")
        : target(target::ParseDeviceOptions(device)) {}

    target::SimulatedDevice target;
    SettingStore settings;
    Reporter reporter{Reporter::Options{Verbosity::Quiet, false, "none"}};
    WorkMeter meter{reporter};
    FlashWatch watch{meter};
    FlashHost host{target, settings, reporter, watch, "dir/"};
};

}  // namespace host
