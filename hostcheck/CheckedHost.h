// The host under examination: its slots, called so that nothing it does can end the examination.

#pragma once

#include <cstdint>
#include <exception>
#include <optional>
#include <stdexcept>
#include <string>

#include "hostcheck/ReadableMemory.h"
#include "hostcheck/Texts.h"
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

/// Registers and single values are on this page, and the contents of flash on that one.
inline constexpr std::int16_t kGeneralPage = 1;
inline constexpr std::int16_t kFlashPage = 0;

class CheckedHost {
  public:
    explicit CheckedHost(IFlashHost* host) : host_(host) {}

    /// What a slot returns: nothing, or a text. Breach for anything else: an exception, or a
    /// pointer to no text.
    template <typename Call>
    std::optional<std::string> Ask(Call call) const {
        return Text(Called(call));
    }

    /// The same. Breach also when the text doesn't stay until the next call.
    template <typename Call>
    std::optional<std::string> AskForAWhile(Call call) const {
        return LastingText(Called(call));
    }

    /// Calls a slot that has to succeed. Breach with its error text.
    template <typename Call>
    void Do(Call call) const {
        if (const auto error = Ask(call)) throw Breach("the error text " + Quoted(*error));
    }

    std::optional<std::string> Get(const std::string& name) const;
    void Set(const std::string& name, const std::string& value) const;

    /// `bytes` has to be a multiple of `width`. Breach also when the slot writes outside of the
    /// room that the plug-in has for such a read.
    Bytes Read(std::uint32_t address, std::size_t bytes, std::size_t width,
               std::int16_t page = kGeneralPage) const;
    void Write(std::uint32_t address, const Bytes& bytes, std::size_t width,
               std::int16_t page = kGeneralPage) const;

    /// A register or a single value, in one access of 32 bits.
    std::uint32_t ReadWord(std::uint32_t address) const;
    void WriteWord(std::uint32_t address, std::uint32_t value) const;

    void Halt() const;
    void Run() const;
    void Reset(bool flag) const;
    void Sleep(std::uint32_t milliseconds) const;

    /// Says what comes next, where a host may never come back. Whether that is shown is checked
    /// elsewhere.
    void Announce(const char* text) const;

    /// The page that the running WriteDataToFlash was called with.
    std::int16_t page = kGeneralPage;

    /// How far the loader has come in the running call. It is started only when `cleared` says that
    /// no status word can hold a chunk that nobody has handed over.
    struct LoaderProgress {
        bool loaded = false;
        bool cleared = false;
        bool runs = false;
        bool takesChunks = false;
        unsigned turn = 0;  ///< the block that it looks at next
        Bytes flashBefore;
    };
    LoaderProgress loader;

  private:
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

    /// What a pointer leads to, null to nothing. Breach when that is no text.
    static std::optional<std::string> Text(const char* text);
    static std::optional<std::string> LastingText(const char* text);

    IFlashHost* host_;
};

}  // namespace hostcheck
