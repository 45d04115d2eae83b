// The host's services as the device code wants them: values returned, failures thrown. Nothing else
// in the library calls a slot of the host.

#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "plugin/IFlashHost.h"

/// Owns one open progress display and ends it exactly once. Empty once closed.
class ProgressHandle {
  public:
    /// Takes over a display that has begun.
    explicit ProgressHandle(IFlashHost* host) : p_mHost(host) {}

    /// Reports how far the work has come. The display must be open. Throws std::runtime_error with
    /// the host's error text when it returns one.
    void UpdateProgress(std::uint32_t percent, const std::string& text) const;

    /// Ends the display, if it is open, and throws what the host says. The handle is empty
    /// afterwards, whether or not it throws.
    void CloseProgress();

    /// Ends the display, if it is open, and ignores what the host says: for paths on which another
    /// failure is being reported already. So does the destructor.
    void CloseQuietly() noexcept { p_mHost.reset(); }

  private:
    struct EndQuietly {
        void operator()(IFlashHost* host) const noexcept { host->EndProgress(); }
    };

    std::unique_ptr<IFlashHost, EndQuietly> p_mHost;
};

/// A thin wrapper around the host pointer. Unless it says otherwise, an operation throws
/// std::runtime_error with the host's error text, unchanged, when its slot returns one.
class HostAccess {
  public:
    explicit HostAccess(IFlashHost* host) : p_mHost(host) {}

    /// The value of a setting. Throws std::logic_error when the host does not know it.
    std::string GetSetting(const std::string& name) const;
    void SetSetting(const std::string& name, const std::string& value) const;

    void HaltTarget() const;
    void ResetTarget(bool flag) const;
    void RunTarget() const;
    void LoadProgram(const std::string& fileName, const std::string& directory) const;
    void Sleep(std::uint32_t milliseconds) const;

    /// One access of 32 or 16 bits on page 1, where the registers are.
    std::uint32_t ReadWord(std::uint64_t address) const;
    void WriteWord(std::uint64_t address, std::uint32_t value) const;
    void WriteHalfword(std::uint64_t address, std::uint16_t value) const;

    /// Single bytes of any page, as many as `count` says.
    void ReadBytes(void* buffer, std::size_t count, std::uint64_t address, std::int16_t page) const;
    void WriteBytes(const void* buffer, std::size_t count, std::uint64_t address,
                    std::int16_t page) const;

    ProgressHandle OpenProgress(const std::string& title) const;

    void ShowErrorText(const std::string& text) const;
    void ShowMessageText(const std::string& text) const;

    /// A copy of the host's directory text. Never fails.
    std::string Directory() const;

  private:
    template <typename... Parameters, typename... Arguments>
    void Call(const char* (IFlashHost::*slot)(Parameters...), Arguments... arguments) const;

    IFlashHost* p_mHost;
};
