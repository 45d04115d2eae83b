// A simulated device as the target, new or kept in a file.

#pragma once

#include <memory>
#include <optional>
#include <string>

#include "host/files/FileLock.h"
#include "host/targets/OpenTarget.h"
#include "target/simulated/SimulatedDevice.h"

namespace host {

class SimulatedTarget final : public OpenTarget {
  public:
    /// Keeps the contents file locked for as long as it lives. When another run has it, `say` is
    /// told so, and that run is waited for. Failure (WrongUsage) for options that name no device,
    /// or another one than the file holds; Failure (Unreachable) for a contents file that can't be
    /// used.
    SimulatedTarget(const TargetOptions& options, const WaitNotice& say);

    target::Target& Get() override { return *device_; }
    std::string Advice() override { return "check the options of --sim"; }
    std::string Description() const override;

    /// Which device, and where it is kept.
    std::string Name() const;
    target::SimulatedDevice& Device() { return *device_; }

    /// Keeps the contents, if a file was named for them; a file that is there already is left alone
    /// when nothing has `changed`.
    void Keep(bool changed) override;
    void Release(bool run) override;

  private:
    std::string path_;
    std::optional<FileLock> lock_;
    std::unique_ptr<target::SimulatedDevice> device_;
};

}  // namespace host
