// The piece of target RAM that the checks work on, put back when they are done with it.

#pragma once

#include <algorithm>

#include "device/RegisterMap.h"
#include "hostcheck/CheckedHost.h"

namespace hostcheck {

/// In calls of 2048 bytes at most, which is the most that a plug-in writes in one.
inline void WriteAll(const CheckedHost& host, std::uint32_t start, const Bytes& bytes) {
    constexpr std::size_t most = LoaderMemory::BufferSize;
    for (std::size_t at = 0; at < bytes.size(); at += most) {
        const auto from = bytes.begin() + static_cast<std::ptrdiff_t>(at);
        const auto count = static_cast<std::ptrdiff_t>(std::min(most, bytes.size() - at));
        host.Write(start + static_cast<std::uint32_t>(at), {from, from + count}, 4);
    }
}

class RamWindow {
  public:
    /// Behind the loader's two buffers and two parameter blocks, and how much the checks use there.
    static constexpr std::uint32_t kStart =
        LoaderMemory::ParameterBlocks + 2 * LoaderMemory::ParameterBlockSize;
    static constexpr std::size_t kBytesMax = LoaderMemory::BufferSize + 32;

    RamWindow(CheckedHost& host, std::size_t bytes, std::uint32_t start = kStart)
        : host_(host), start_(start), kept_(host.Read(start, bytes, 4)) {}
    RamWindow(const RamWindow&) = delete;
    RamWindow& operator=(const RamWindow&) = delete;
    ~RamWindow() {
        try {
            WriteAll(host_, start_, kept_);
        } catch (const std::exception&) {
            // The check that failed to write says so.
        }
    }

  private:
    CheckedHost& host_;
    std::uint32_t start_;
    Bytes kept_;
};

}  // namespace hostcheck
