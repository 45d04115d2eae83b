// A target of the kind that the command line asks for, while it is open. What kinds there are
// stands in one table.

#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "base/AddressRange.h"
#include "host/base/Json.h"
#include "host/files/FileLock.h"
#include "target/Target.h"

namespace host {

/// As the command line names it.
struct TargetOptions {
    std::optional<std::string> sim;       ///< class and options of a simulated device
    std::optional<std::string> simFile;   ///< where its contents are kept
    std::optional<std::string> gdb;       ///< where a GDB server listens
    std::vector<std::string> gdbOptions;  ///< how to deal with it
    std::optional<std::string> loader;    ///< the loader's file, for a real target
    std::optional<std::string> wait;      ///< for how long a real target is tried to be reached
    std::optional<std::string> expect;    ///< what the device must be, whatever it is reached by
};

/// The same for JSON lines; null when they contradict each other.
Json ToJson(const TargetOptions& options);

/// Takes lines for the trace; `source` is who speaks.
using TraceLine = std::function<void(const char* source, const std::string& text)>;

/// The server between the tool and its target.
struct ServerFacts {
    std::string name;             ///< "the GDB server at localhost:3333 (OpenOCD)"
    std::size_t packetBytes = 0;  ///< the longest packet that it takes
    bool binaryWrites = false;    ///< it takes bytes as they are, not as digits
    std::string reportsReads;     ///< what makes it tell of reads that fail
};

class OpenTarget {
  public:
    virtual ~OpenTarget() = default;

    virtual target::Target& Get() = 0;

    /// What there is in place of a device of the family, so far as it tells, or what to check: to
    /// be said when none was found.
    virtual std::string Advice() = 0;

    /// What is worked on, in one line for the user.
    virtual std::string Description() const = 0;

    /// What the plug-in has found out: the address behind the device's RAM.
    virtual void RamEndsAt(std::uint32_t /*address*/) {}

    /// Nothing where there is none.
    virtual std::optional<ServerFacts> Server() const { return std::nullopt; }

    /// To be asked before flash is erased for a load. Failure (BadFile) when the loader's file
    /// can't be had; `directory` is what the host tells the plug-in.
    virtual void RequireLoader(const std::string& /*directory*/) {}

    /// What loading and running the loader changes of the memory beside flash; nothing where it
    /// isn't a program in RAM. TargetError.
    virtual std::vector<base::AddressRange> LoaderMemory(const std::string& /*directory*/) {
        return {};
    }

    /// Where the halted program stands, if that can be known.
    virtual std::optional<std::uint32_t> ProgramCounter() { return std::nullopt; }

    /// Keeps what must outlive the run; `changed` tells whether there is anything new. Failure
    /// (BadFile).
    virtual void Keep(bool /*changed*/) {}

    /// The last thing done with a target: leaves it halted, or has it run its own program from
    /// where the last reset has put it. TargetError.
    virtual void Release(bool run) = 0;
};

/// Failure (WrongUsage) for options of several kinds of target.
void RequireOneKind(const TargetOptions& options);

/// Failure (WrongUsage) for options that name no target, Failure (Unreachable) for a target that
/// can't be had. `trace` may be empty. When another run has to be waited for, `say` is told which.
std::unique_ptr<OpenTarget> Open(const TargetOptions& options, const TraceLine& trace,
                                 const WaitNotice& say);

}  // namespace host
