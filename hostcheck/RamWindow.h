// The piece of target RAM that the checks work on, put back when they are done with it.

#pragma once

#include "hostcheck/CheckedHost.h"

namespace hostcheck {

class RamWindow {
  public:
    /// Behind the loader's two buffers and two parameter blocks.
    static constexpr std::uint32_t kStart = 0x20001020;

    RamWindow(CheckedHost& host, std::size_t bytes)
        : host_(host), kept_(host.Read(kStart, bytes, 4)) {}
    RamWindow(const RamWindow&) = delete;
    RamWindow& operator=(const RamWindow&) = delete;
    ~RamWindow() {
        try {
            host_.Write(kStart, kept_, 4);
        } catch (const std::exception&) {
            // The check that failed to write says so.
        }
    }

  private:
    CheckedHost& host_;
    Bytes kept_;
};

}  // namespace hostcheck
