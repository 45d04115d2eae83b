#include "bench/support/Workloads.h"

#include <fmt/format.h>

#include <stdexcept>

namespace test {

namespace {

constexpr std::uint32_t kSectorSizeBytes = 1024;
constexpr std::uint32_t kLoaderChunkBytes = 2048;
constexpr std::uint32_t kReadChunkBytes = 32752;
constexpr std::uint32_t kSparseStepBytes = 4096;
constexpr std::uint32_t kSparseSegmentBytes = 16;

// What it takes at least: for a chunk its bytes, its parameters and a poll; for a sector its
// address, the command and a poll, with the three pauses that the controller needs; for reading
// the reads. For a segment of a sparse image one sector, one chunk, halting, loading and starting.
constexpr std::uint64_t kCallsPerLoaderChunk = 3;
constexpr std::uint64_t kCallsPerSector = 6;
constexpr std::uint64_t kCallsPerSegment = kCallsPerSector + kCallsPerLoaderChunk + 3;

std::uint64_t Pieces(std::uint32_t address, std::uint32_t sizeBytes, std::uint32_t pieceBytes) {
    return (address % pieceBytes + std::uint64_t{sizeBytes} + pieceBytes - 1) / pieceBytes;
}

void Require(const char* error) {
    if (error != nullptr) throw std::runtime_error(error);
}

void Write(Plugin& plugin, std::uint32_t address, std::uint32_t sizeBytes) {
    static std::vector<unsigned char> data;
    if (data.size() < sizeBytes) data.resize(sizeBytes, 0x5A);
    Require(plugin->WriteDataToFlash(data.data(), address, sizeBytes, 1));
}

void RunProgram(LeanHost& host, Plugin& plugin, const Workload& work) {
    host.settings["FlashProgramOption"] = "Do Not Erase Flash Memory";
    Require(plugin->ResetSettings(0));
    Write(plugin, work.address, work.sizeBytes);
}

void RunSparse(LeanHost&, Plugin& plugin, const Workload& work) {
    Require(plugin->ResetSettings(0));
    for (std::uint32_t at = 0; at < work.sizeBytes; at += kSparseSegmentBytes) {
        Write(plugin, at / kSparseSegmentBytes * kSparseStepBytes, kSparseSegmentBytes);
    }
}

// An operation on a range, by the names of its settings.
void Perform(LeanHost& host, Plugin& plugin, const Workload& work, const std::string& name,
             const std::string& selection, const std::string& prefix) {
    host.settings[selection] = "By Address Range";
    host.settings[prefix + "StartAddr"] = fmt::format("{:x}", work.address);
    host.settings[prefix + "EndAddr"] = fmt::format("{:x}", work.address + work.sizeBytes - 1);
    Require(plugin->PerformOperation(name.c_str()));
}

void RunErase(LeanHost& host, Plugin& plugin, const Workload& work) {
    Perform(host, plugin, work, "Erase", "FlashEraseType", "FlashErase");
}

void RunBlankCheck(LeanHost& host, Plugin& plugin, const Workload& work) {
    Perform(host, plugin, work, "BlankCheck", "FlashBlankCheckSelection", "FlashBlankCheck");
}

void RunChecksum(LeanHost& host, Plugin& plugin, const Workload& work) {
    Perform(host, plugin, work, "CalculateChecksum", "FlashChecksumSelection", "FlashChecksum");
}

}  // namespace

Workload Program(std::uint32_t address, std::uint32_t sizeBytes) {
    const std::uint32_t widened = sizeBytes + address % 128;
    return {"program", address, sizeBytes, RunProgram,
            kCallsPerLoaderChunk * Pieces(0, widened, kLoaderChunkBytes)};
}

Workload Erase(std::uint32_t address, std::uint32_t sizeBytes) {
    return {"erase", address, sizeBytes, RunErase,
            kCallsPerSector * Pieces(address, sizeBytes, kSectorSizeBytes)};
}

Workload BlankCheck(std::uint32_t address, std::uint32_t sizeBytes) {
    const std::uint32_t widened = address % 4 + sizeBytes;
    return {"blank-check", address, sizeBytes, RunBlankCheck, Pieces(0, widened, kReadChunkBytes)};
}

Workload Checksum(std::uint32_t address, std::uint32_t sizeBytes) {
    return {"checksum", address, sizeBytes, RunChecksum, Pieces(0, sizeBytes, kReadChunkBytes)};
}

Workload ProgramSparse(std::uint32_t segments) {
    return {"program-sparse", 0, segments * kSparseSegmentBytes, RunSparse,
            kCallsPerSegment * segments};
}

Counts CountCalls(const Workload& work) {
    NullTarget target;
    LeanHost host(target);
    Plugin plugin(host);
    host.counts = {};
    work.run(host, plugin, work);
    return host.counts;
}

std::vector<Workload> CountedWorkloads() {
    std::vector<Workload> works;
    for (const auto make : {Program, Erase, BlankCheck, Checksum}) {
        for (const std::uint32_t sizeBytes :
             {1U, 2047U, 2048U, 2049U, 1U << 16, 1U << 20, 1U << 24}) {
            works.push_back(make(0x1000, sizeBytes));
            works.push_back(make(0x1001, sizeBytes));
        }
    }
    works.push_back(ProgramSparse(256));
    return works;
}

}  // namespace test
