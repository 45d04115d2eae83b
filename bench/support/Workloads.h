// The works that are counted and timed, each on a range of flash.

#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "bench/support/LeanHost.h"

namespace test {

struct Workload {
    std::string name;
    std::uint32_t address = 0;
    std::uint32_t sizeBytes = 0;
    void (*run)(LeanHost&, Plugin&, const Workload&) = nullptr;
    std::uint64_t leastCalls = 0;  ///< that the device's protocol allows
};

Workload Program(std::uint32_t address, std::uint32_t sizeBytes);
Workload Erase(std::uint32_t address, std::uint32_t sizeBytes);
Workload BlankCheck(std::uint32_t address, std::uint32_t sizeBytes);
Workload Checksum(std::uint32_t address, std::uint32_t sizeBytes);

/// `segments` segments of 16 bytes, 4 KiB apart, whose sectors are erased as they come.
Workload ProgramSparse(std::uint32_t segments);

/// What a run asks of the host.
Counts CountCalls(const Workload& work);

/// The works whose calls are counted: 1 byte to 16 MiB, aligned and not, and the sparse image.
std::vector<Workload> CountedWorkloads();

}  // namespace test
