// Flash in memory, which writes down how it is looked at.

#pragma once

#include <fmt/format.h>

#include <algorithm>
#include <string>
#include <vector>

#include "host/driver/FlashReader.h"
#include "host/output/WorkMeter.h"

namespace test {

class FakeFlash final : public host::FlashReader {
  public:
    FakeFlash(std::uint64_t flashBytes, std::uint8_t value) : bytes(flashBytes, value) {}

    bool Contains(std::uint32_t address) override { return address < bytes.size(); }
    void Halt() override { log += "halt "; }
    std::vector<std::uint8_t> ReadFlash(const base::AddressRange& range) override {
        log += fmt::format("{:x}-{:x} ", range.first, range.last);
        meter.Advance(range.Size());
        return {bytes.begin() + range.first, bytes.begin() + std::ptrdiff_t{range.last} + 1};
    }
    std::optional<bool> HoldsByChecksum(std::uint32_t address,
                                        std::span<const std::uint8_t> wanted) override {
        if (!sumsUp) return std::nullopt;
        log += fmt::format("sum:{:x} ", address);
        const bool holds = std::equal(wanted.begin(), wanted.end(), bytes.begin() + address);
        if (holds) meter.Advance(wanted.size());
        return holds;
    }

    /// "DONE of TOTAL" bytes.
    std::string Progress(host::Phase phase) const {
        const host::PhaseProgress& progress = meter.Phases()[phase];
        return fmt::format("{} of {}", progress.doneBytes, progress.totalBytes);
    }

    std::vector<std::uint8_t> bytes;
    bool sumsUp = false;
    std::string log;
    host::Reporter reporter{host::Reporter::Options{host::Verbosity::Quiet, false, "none"}};
    host::WorkMeter meter{reporter};
};

}  // namespace test
