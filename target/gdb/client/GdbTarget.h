// GdbTarget: a board behind a GDB server, driven as any other target. It knows the protocol and
// nothing of any one core, probe or flash.
//
// A server in all-stop mode lets nobody ask a running target. An access to one then stops the core
// for a moment; it stays stopped until somebody waits for it again (a Pause, or a read that finds
// it busy), so that a chunk's writes and the looks around them cost one stop.

#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>

#include "target/Target.h"
#include "target/gdb/client/Connection.h"
#include "target/gdb/client/Core.h"
#include "target/gdb/client/GdbOptions.h"
#include "target/gdb/client/MemoryPort.h"
#include "target/gdb/client/RegisterNumbers.h"
#include "target/gdb/wire/Replies.h"

namespace target::gdb {

/// Memory through which the program that LoadProgram loads is spoken to. It is zeroed before the
/// program is loaded, and read whole by each look, so that the next question is answered, too.
struct Mailbox {
    std::uint32_t address = 0;
    std::uint32_t sizeBytes = 0;
    /// A word of this value says that the program has work to do: whoever has read one waits.
    std::uint32_t busyWord = 0;
};

class GdbTarget final : public Target {
  public:
    /// Connects and stops the target. TargetError, also for every operation below; after an error
    /// that leaves it open what the server would answer next, all operations fail.
    GdbTarget(const Address& address, const GdbOptions& options, const Mailbox& mailbox,
              InterruptCheck interrupted, const PacketTrace& trace);

    void Read(void* buffer, std::size_t count, std::uint32_t address, int page,
              std::size_t width) override;
    void Write(const void* buffer, std::size_t count, std::uint32_t address, int page,
               std::size_t width) override;

    /// Writes the program's ELF file into RAM and compares it; then sets program counter and stack.
    void LoadProgram(const std::string& fileName, const std::string& directory) override;

    /// Whether LoadProgram would find a program that it can load; touches nothing.
    void RequireProgram(const std::string& fileName, const std::string& directory);

    void Run() override;
    void Halt() override;
    void Reset(bool flag) override;
    void Pause(std::uint32_t milliseconds) override;
    bool LooksStopIt() const override { return !core_.IsLive(); }

    /// Where the stack of a loaded program begins, unless the options say otherwise.
    void SetRamEnd(std::uint32_t address) { ramEnd_ = address; }

    /// Lets the server go; the target is left halted, or started where it stands. Nothing can be
    /// done with this object then.
    void Release(bool start);

    std::uint64_t PacketCount() const { return connection_.SentCount(); }

  private:
    using Text = std::function<std::string()>;

    void Perform(const Text& describe, const std::function<void()>& action);
    void Attach();
    std::string Monitor(const std::string& command);
    std::string ReadDocument(const std::string& name);
    unsigned RegisterNumber(const std::string& name, const std::optional<std::uint32_t>& given);
    void WriteRegister(unsigned number, std::uint32_t value);
    void LoadSegments(const std::string& path);
    void StopForAccess();
    void Resume();
    std::string ReadMailbox(std::uint32_t address, std::size_t size);
    bool InMailbox(std::uint32_t address, std::size_t size) const;
    bool OverlapsMailbox(std::uint32_t address, std::size_t size) const;

    const std::string name_;
    const GdbOptions options_;
    const Mailbox mailbox_;
    const InterruptCheck interrupted_;
    std::optional<std::uint32_t> ramEnd_;
    Connection connection_;
    Features features_;
    MemoryPort memory_;
    Core core_;
    std::optional<RegisterNumbers> registers_;
    std::optional<std::string> look_;  ///< the mailbox, while nothing has gone on since
    bool started_ = false;             ///< by Run, and neither halted nor reset since
    bool liveTried_ = false;
};

}  // namespace target::gdb
