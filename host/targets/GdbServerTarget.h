// A board behind a GDB server as the target.

#pragma once

#include <memory>

#include "host/targets/OpenTarget.h"
#include "target/gdb/client/GdbTarget.h"

namespace host {

class GdbServerTarget final : public OpenTarget {
  public:
    /// Failure (WrongUsage) for options that can't be read, Failure (Unreachable) for a server or a
    /// target that can't be had.
    GdbServerTarget(const TargetOptions& options, const TraceLine& trace);

    target::Target& Get() override { return *target_; }
    std::string Advice() override;
    void RamEndsAt(std::uint32_t address) override { target_->SetRamEnd(address); }
    void RequireLoader(const std::string& directory) override;
    void Release(bool run) override { target_->Release(run); }

  private:
    std::unique_ptr<target::gdb::GdbTarget> target_;
};

}  // namespace host
