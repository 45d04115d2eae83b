// ServedSimulation: the simulated device as the GDB server wants it, with the registers of a core
// that executes nothing. What is started in RAM after having been written there is the loader.

#pragma once

#include <functional>
#include <string>
#include <vector>

#include "target/gdb/server/ServedDevice.h"
#include "target/simulated/SimulatedDevice.h"

namespace target {

class ServedSimulation final : public gdb::ServedDevice {
  public:
    /// `complain` receives the rules that were broken without the device refusing anything;
    /// `clientGone` is called for each client.
    ServedSimulation(SimulatedDevice& device, std::function<void(const std::string&)> complain,
                     std::function<void()> clientGone);

    std::vector<gdb::MemoryRegion> Regions() const override;
    std::string Read(std::uint32_t address, std::size_t sizeBytes, std::size_t width) override;
    void Write(std::uint32_t address, std::string_view bytes, std::size_t width) override;
    void EraseFlash(std::uint32_t address, std::uint32_t sizeBytes) override;
    void ProgramFlash(std::uint32_t address, std::string_view bytes) override;
    gdb::CoreRegisters& Registers() override { return registers_; }
    void Start() override;
    void Stop() override;
    bool IsRunning() const override { return device_.IsRunning(); }
    void Reset() override;
    void ClientGone() override { clientGone_(); }

  private:
    void Do(const std::function<void()>& action);
    bool WasWritten(std::uint32_t address) const;
    void ResetRegisters();

    SimulatedDevice& device_;
    const std::function<void(const std::string&)> complain_;
    const std::function<void()> clientGone_;
    gdb::CoreRegisters registers_;
    std::vector<bool> writtenWords_;  ///< of the RAM
    bool inLoader_ = false;
    std::uint32_t haltedAt_ = 0;
};

}  // namespace target
