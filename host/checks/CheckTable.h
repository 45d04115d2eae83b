// What a check works on, how it ends, and all of them.

#pragma once

#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include "host/checks/Checks.h"
#include "host/checks/SavedMemory.h"
#include "host/targets/OpenTarget.h"
#include "target/Target.h"

namespace host {

/// What came in place of what a load needs.
class CheckFailed : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// Something that a load can do without.
class CheckNoted : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// Why a check can't be made here.
class CheckNotMade : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// What the checks work on, and what an earlier one has found out for those behind it.
struct CheckSubject {
    OpenTarget& opened;
    const DeviceInfo& info;
    bool readsTrusted;  ///< the user knows that failed reads may be hidden

    std::optional<SavedMemory> memory = {};
    std::optional<std::vector<base::AddressRange>> loader =
        {};  ///< where it goes, if it can be had
    bool resets = false;
    LinkSpeed speed = {};

    target::Target& Target() const { return opened.Get(); }
};

// Each returns what was seen, or throws one of the above; a TargetError is a failure, too.

// LinkChecks.cpp: what the server says, and how it takes accesses to registers.
std::string CheckFailedReads(CheckSubject& subject);
std::string CheckRegisters(CheckSubject& subject);
std::string CheckHalfRegisters(CheckSubject& subject);
std::string CheckPackets(CheckSubject& subject);

// MemoryChecks.cpp: the loader's buffers, and how fast they are reached.
std::string CheckMemory(CheckSubject& subject);
std::string CheckDelay(CheckSubject& subject);
std::string CheckRate(CheckSubject& subject);
std::string CheckChecksum(CheckSubject& subject);

// LoaderChecks.cpp: the file, a reset, a run, and that all is as it was.
std::string CheckLoader(CheckSubject& subject);
std::string CheckReset(CheckSubject& subject);
std::string CheckRun(CheckSubject& subject);
std::string PutBack(CheckSubject& subject);

}  // namespace host
