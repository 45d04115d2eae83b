// Rules: what the simulated device demands of whoever drives it, each with a name that its error
// texts end in, and the log of those that were broken.

#pragma once

#include <cstddef>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace target {

namespace rule {

// Broken by an access that is refused.
inline constexpr char kPage[] = "page";
inline constexpr char kAccessWidth[] = "access-width";
inline constexpr char kAlignedAccess[] = "aligned-access";
inline constexpr char kMappedAddress[] = "mapped-address";
inline constexpr char kReadOnlyRegister[] = "read-only-register";
inline constexpr char kFlashReadOnly[] = "flash-read-only";
inline constexpr char kFlashBusy[] = "flash-busy";
inline constexpr char kOneCommand[] = "one-command";
inline constexpr char kKnownCommand[] = "known-command";
inline constexpr char kHaltedForErase[] = "halted-for-erase";
inline constexpr char kSectorAddress[] = "sector-address";
inline constexpr char kCommitAddress[] = "commit-address";
inline constexpr char kHaltedForLoad[] = "halted-for-load";
inline constexpr char kKnownProgram[] = "known-program";
inline constexpr char kLoadedForRun[] = "loaded-for-run";
inline constexpr char kHaltedForRun[] = "halted-for-run";
inline constexpr char kBufferInUse[] = "buffer-in-use";

// Broken without anybody being told: the device has no way to, or ignores the request. Writes that
// come too soon or out of order are lost, as they are on silicon.
inline constexpr char kWriteKey[] = "write-key";
inline constexpr char kFlashBlocks[] = "flash-blocks";
inline constexpr char kBlockWrite[] = "block-write";
inline constexpr char kFlashTiming[] = "flash-timing";
inline constexpr char kHaltedForTiming[] = "halted-for-timing";
inline constexpr char kTimingSetUp[] = "timing-set-up";
inline constexpr char kClockSetUp[] = "clock-set-up";
inline constexpr char kHaltedForClock[] = "halted-for-clock";
inline constexpr char kClockSettling[] = "clock-settling";
inline constexpr char kFixUp[] = "fix-up";
inline constexpr char kResetRecovery[] = "reset-recovery";
inline constexpr char kPeripheralReset[] = "peripheral-reset";
inline constexpr char kHaltedForReset[] = "halted-for-reset";
inline constexpr char kRomAlias[] = "rom-alias";
inline constexpr char kBank[] = "bank";
inline constexpr char kAddressSetUp[] = "address-set-up";
inline constexpr char kEraseRecovery[] = "erase-recovery";
inline constexpr char kStatusDelay[] = "status-delay";
inline constexpr char kEraseSettling[] = "erase-settling";
inline constexpr char kResetAfterErase[] = "reset-after-erase";
inline constexpr char kLoaderParameters[] = "loader-parameters";
inline constexpr char kErasedCells[] = "erased-cells";

}  // namespace rule

/// Thrown where a rule is broken; the device puts the access before the text.
class RuleBroken : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

[[noreturn]] void Refuse(const char* ruleName, const std::string& why);

class RuleLog {
  public:
    /// A client that breaks rules without end must not take all memory.
    static constexpr std::size_t kTextsMax = 1000;

    void Record(const char* ruleName, const std::string& what);
    void Record(const std::string& text);
    const std::vector<std::string>& Texts() const { return texts_; }

    /// The texts, which are forgotten.
    std::vector<std::string> Take() { return std::exchange(texts_, {}); }

  private:
    std::vector<std::string> texts_;
};

}  // namespace target
