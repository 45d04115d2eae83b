// The host's services as the device code wants them: values returned, failures thrown.

#pragma once

#include <cstdint>
#include <string>
#include <utility>

#include "plugin/IFlashHost.h"

/// Owns one open progress display and ends it exactly once. Movable; empty once closed.
class ProgressHandle {
  public:
    /// Takes over a display that has begun.
    explicit ProgressHandle(IFlashHost* host) : p_mHost(host) {}
    ProgressHandle(ProgressHandle&& other) noexcept
        : p_mHost(std::exchange(other.p_mHost, nullptr)) {}
    ProgressHandle& operator=(ProgressHandle&& other) noexcept {
        std::swap(p_mHost, other.p_mHost);
        return *this;
    }
    ~ProgressHandle() { CloseQuietly(); }

    /// Ends the display, if it is open, and ignores what the host says: for paths on which
    /// another failure is being reported already.
    void CloseQuietly() noexcept {
        if (IFlashHost* host = std::exchange(p_mHost, nullptr)) host->EndProgress();
    }

  private:
    friend class HostAccess;

    IFlashHost* p_mHost;
};

/// A thin wrapper around the host pointer. Unless it says otherwise, an operation throws
/// std::runtime_error with the host's error text, unchanged, when its slot returns one.
class HostAccess {
  public:
    explicit HostAccess(IFlashHost* host) : p_mHost(host) {}

    /// The value of a setting. Throws std::logic_error when the host does not know it.
    std::string GetSetting(const std::string& name) const;
    void SetSetting(const std::string& name, const std::string& value) const;

    /// One 32-bit access on page 1, where the registers are.
    std::uint32_t ReadWord(std::uint64_t address) const;
    void WriteWord(std::uint64_t address, std::uint32_t value) const;

    ProgressHandle OpenProgress(const std::string& title) const;

    /// Ends the display explicitly. The handle is empty afterwards, whether or not it throws.
    static void CloseProgress(ProgressHandle& progress);

    void ShowErrorText(const std::string& text) const;
    void ShowMessageText(const std::string& text) const;

    /// A copy of the host's directory text. Never fails.
    std::string Directory() const;

  private:
    IFlashHost* p_mHost;
};
