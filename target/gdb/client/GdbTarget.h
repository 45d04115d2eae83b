// GdbTarget: a board behind a GDB server, driven as any other target. It knows the protocol, and of
// the core, the probe and the flash only what the options say.
//
// Run begins what Halt, Reset or a crash ends; `started_` says that it is so. After a crash every
// look at the mailbox fails with what was said of it, until Halt or Reset: nobody waits for a
// program that is known to have stopped. Before it, the core itself may be stopped for a look. Then
//
// - where the running core can be asked (live), it is never stopped;
// - everywhere else an access stops it, and it stays stopped, so that a chunk's writes and the
// looks
//   around them cost one stop, until somebody waits: in a pause, or by a read of one word that
//   finds the program busy, or of memory beside the mailbox.
//
// Before the constructor returns, the server has shown that the target is halted and that it tells
// of reads that fail, or was trusted.

#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "base/AddressRange.h"
#include "target/Target.h"
#include "target/gdb/client/Connection.h"
#include "target/gdb/client/Core.h"
#include "target/gdb/client/GdbOptions.h"
#include "target/gdb/client/LoaderFile.h"
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
    struct Lent {};

    /// Connects and stops the target. TargetError, also for every operation below; after an error
    /// that leaves it open what the server would answer next, all operations fail.
    GdbTarget(const Address& address, const GdbOptions& options, const Mailbox& mailbox,
              InterruptCheck interrupted, PacketTrace trace);

    /// The same behind a debugger that uses the connection, too, and introduces itself first:
    /// connects, and sends nothing before Join.
    GdbTarget(const Address& address, const GdbOptions& options, const Mailbox& mailbox,
              InterruptCheck interrupted, PacketTrace trace, Lent);

    /// The debugger has found out what the server can do; whether it knows the core to be stopped.
    void Join(const Features& features, bool stopped);

    /// For the debugger's packets, and for requests that are no target's business.
    Connection& Wire() { return connection_; }

    void Read(void* buffer, std::size_t count, std::uint32_t address, int page,
              std::size_t width) override;
    void Write(const void* buffer, std::size_t count, std::uint32_t address, int page,
               std::size_t width) override;

    /// Writes the program's ELF file into RAM and compares it; then sets program counter and stack.
    void LoadProgram(const std::string& fileName, const std::string& directory) override;

    /// Whether LoadProgram would find a program that it can load; touches nothing.
    void RequireProgram(const std::string& fileName, const std::string& directory);

    /// What loading and running that program changes: its segments, what lies from the start of
    /// the RAM to the end of the mailbox, and the stack, as far as such a program needs one.
    std::vector<base::AddressRange> MemoryOfProgram(const std::string& fileName,
                                                    const std::string& directory) const;

    /// The numbers of the core's registers by name; none when the server doesn't tell them.
    const RegisterNumbers& Registers();

    /// By the server's "qCRC", once it has summed up right what was just written to the loader's
    /// RAM, twice; what was there is put back.
    std::optional<std::uint32_t> Checksum(std::uint32_t address, std::uint32_t sizeBytes) override;

    void Run() override;
    void Halt() override;
    void Reset(bool flag) override;
    void Pause(std::chrono::nanoseconds time) override;
    bool StopsForReads() const override { return !core_.RunsLive(); }
    bool HidesFailedReads() const override { return options_.readsTrusted; }
    bool StandsStill() const override { return started_ && core_.IsStopped(); }
    std::chrono::nanoseconds RanFor() const override { return core_.RanFor(); }

    /// Where the stopped program stands, if the server tells.
    std::optional<std::uint32_t> ProgramCounter();

    /// Where the stack of a loaded program begins, unless the options say otherwise.
    void SetRamEnd(std::uint32_t address) { ramEnd_ = address; }

    /// What the server's description says of its target: "architecture armv7e-m"; may be empty.
    std::string Description();

    bool IsConnected() const { return !connection_.IsLost(); }

    /// The profile that is used.
    const Profile& Server() const { return *profile_; }

    std::size_t PacketSize() const { return features_.packetSize; }
    bool WritesBinary() const { return options_.binaryWrites.value_or(profile_->trueX); }

    /// The command or packet that resets.
    std::string ResetText() const { return options_.reset.value_or(profile_->reset); }

    /// Lets the server go; the target is left halted, or started where it stands. Nothing can be
    /// done with this object then.
    void Release(bool start);

    std::uint64_t PacketCount() const { return connection_.SentCount(); }

  private:
    using Text = std::function<std::string()>;

    void Perform(const Text& describe, const std::function<void()>& action);
    Connection Connect(const Address& address) const;
    void Attach();
    void Introduce();
    void SetFeatures(const Features& features);
    void FindOut(bool stopped);
    void ChooseProfile();
    void OpenLiveServer();
    void RequireReportedReads();
    void RequireHalted(const std::string& after);
    std::string Monitor(const std::string& command);
    void ResetByPacket(const std::string& packet);
    void RequireFits(const LoaderFile& loader, const std::string& path) const;
    std::string WhereStopped();
    MemoryPort& Memory();
    std::string ReadDocument(const std::string& name);
    unsigned RegisterNumber(const std::string& name, const std::optional<std::uint32_t>& given);
    std::optional<std::uint32_t> ServerChecksum(std::uint32_t address, std::uint32_t sizeBytes);
    bool ProveChecksum();
    void WriteRegister(unsigned number, std::uint32_t value);
    void LoadSegments(const std::string& path);
    void StopForAccess();
    void GoOn();
    std::string ReadMailbox(std::uint32_t address, std::size_t size);
    bool InMailbox(std::uint32_t address, std::size_t size) const;
    bool OverlapsMailbox(std::uint32_t address, std::size_t size) const;

    const std::string name_;
    const GdbOptions options_;
    const Mailbox mailbox_;
    const InterruptCheck interrupted_;
    const PacketTrace trace_;
    std::optional<std::uint32_t> ramEnd_;
    Connection connection_;
    std::optional<Connection> liveConnection_;
    Features features_;
    const Profile* profile_ = Profiles().data();
    MemoryPort memory_;
    std::optional<MemoryPort> liveMemory_;
    Core core_;
    std::optional<RegisterNumbers> registers_;
    std::optional<std::string> mailboxBytes_;  ///< as they are in this stop
    std::string crash_;     ///< that ended what Run began; nobody need wait for it
    bool started_ = false;  ///< by Run, and neither halted nor reset since
    bool liveTried_ = false;
    bool checksumProved_ = false;   ///< since the program was loaded, or the target reset
    bool checksumRefused_ = false;  ///< by the server, or for a wrong one
};

}  // namespace target::gdb
