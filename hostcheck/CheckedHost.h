// The host under examination: its slots, called so that nothing it does can end the examination.

#pragma once

#include <cstdint>
#include <exception>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include "hostcheck/ReadableMemory.h"
#include "plugin/IFlashHost.h"

namespace hostcheck {

/// Thrown where a host breaks its contract; the text says what came.
class Breach : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// Thrown by a check that can't be made; the text says why.
class NotChecked : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

using Bytes = std::vector<std::uint8_t>;

/// Registers and RAM are on this page.
inline constexpr std::int16_t kGeneralPage = 1;

class CheckedHost {
  public:
    explicit CheckedHost(IFlashHost* host) : host_(host) {}

    /// What a slot returns: nothing, or a text. Breach for anything else: an exception, or a
    /// pointer to no text.
    template <typename Call>
    std::optional<std::string> Ask(Call call) const {
        return Text(Called(call));
    }

    /// Calls a slot that has to succeed. Breach with its error text.
    template <typename Call>
    void Do(Call call) const {
        if (const auto error = Ask(call)) throw Breach("the error text " + Quoted(*error));
    }

    std::optional<std::string> Get(const std::string& name) const;
    void Set(const std::string& name, const std::string& value) const;

    /// `bytes` has to be a multiple of `width`. Breach also when the slot writes beside its buffer.
    Bytes Read(std::uint32_t address, std::size_t bytes, std::size_t width,
               std::int16_t page = kGeneralPage) const;
    void Write(std::uint32_t address, const Bytes& bytes, std::size_t width,
               std::int16_t page = kGeneralPage) const;

    void Halt() const;

    /// What a pointer leads to, null to nothing. Breach when that is no text.
    static std::optional<std::string> Text(const char* text);

    /// The pointer that a slot returns. Breach for an exception.
    template <typename Call>
    const char* Called(Call call) const {
        std::string what;
        try {
            return call(*host_);
        } catch (const std::exception& error) {
            what = ": " + Quoted(error.what());
        } catch (...) {
        }
        throw Breach("an exception" + what);
    }

    /// The page that the running WriteDataToFlash was called with, and whether the loader has been
    /// loaded and started in it.
    std::int16_t page = kGeneralPage;
    bool loaderLoaded = false;
    bool loaderRuns = false;

  private:
    IFlashHost* host_;
};

}  // namespace hostcheck
