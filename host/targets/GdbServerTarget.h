// A board behind a GDB server as the target.

#pragma once

#include <memory>
#include <string>
#include <vector>

#include "base/AddressRange.h"
#include "host/targets/OpenTarget.h"
#include "target/gdb/client/GdbTarget.h"

namespace host {

/// What is worked on there, for the user.
inline std::string BoardAt(const std::string& server) {
    return "Board at the GDB server " + server;
}

class GdbServerTarget final : public OpenTarget {
  public:
    /// Failure (WrongUsage) for options that can't be read, Failure (Unreachable) for a server or a
    /// target that can't be had.
    GdbServerTarget(const TargetOptions& options, const TraceLine& trace);

    /// For a connection that a debugger uses, too; it must outlive this. Release leaves it alone.
    explicit GdbServerTarget(target::gdb::GdbTarget& lent) : target_(lent) {}

    target::Target& Get() override { return target_; }
    std::string Advice() override;
    std::string Description() const override { return BoardAt(server_); }
    void RamEndsAt(std::uint32_t address) override { target_.SetRamEnd(address); }
    std::optional<ServerFacts> Server() const override;
    void RequireLoader(const std::string& directory) override;
    std::vector<base::AddressRange> LoaderMemory(const std::string& directory) override;
    std::optional<std::uint32_t> ProgramCounter() override { return target_.ProgramCounter(); }
    void Release(bool run) override {
        if (own_) own_->Release(run);
    }

  private:
    std::string server_;
    std::unique_ptr<target::gdb::GdbTarget> own_;
    target::gdb::GdbTarget& target_;
};

/// Connects to the server behind which a debugger will find a probe. TargetError; Failure
/// (WrongUsage) for options that can't be read, Failure (BadFile) for the loader's file.
class ProbeConnector {
  public:
    ProbeConnector(const TargetOptions& options, TraceLine trace);

    std::unique_ptr<target::gdb::GdbTarget> Connect() const;

  private:
    target::gdb::Address address_;
    target::gdb::GdbOptions options_;
    TraceLine trace_;
};

/// What a load changes of the target's memory beside flash. TargetError.
std::vector<base::AddressRange> LoaderMemory(const target::gdb::GdbTarget& probe,
                                             const std::string& directory);

}  // namespace host
