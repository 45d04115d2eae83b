// What is said when work on a device has failed: a sentence for the user and members for the JSON
// lines, made from all that is known of the flash, the phases and the user registers by then.

#pragma once

#include <optional>
#include <string>
#include <utility>

#include "host/base/Errors.h"
#include "host/base/Json.h"
#include "host/driver/FlashWatch.h"
#include "host/driver/RegisterWatch.h"
#include "host/output/Phases.h"

namespace host {

/// A failure of the device or the plug-in. Part of it may have been shown already: `Remark` is what
/// is left to say, `Result` what is known for the JSON lines.
class DeviceFailure : public Failure {
  public:
    DeviceFailure(ExitStatus status, const std::string& text, std::string remark, Json result)
        : Failure(status, text), remark_(std::move(remark)), result_(std::move(result)) {}

    const std::string& Remark() const { return remark_; }
    const Json& Result() const { return result_; }

  private:
    std::string remark_;
    Json result_;
};

/// The call that failed. One of `error` and `shown` has a text, unless Ctrl-C ended it.
struct FailedCall {
    std::string doing;                      ///< "programming 0x0-0x3ff"
    std::string error = {};                 ///< the call's answer
    std::optional<std::string> shown = {};  ///< the first error that the user has seen already
    std::string cause = {};  ///< the answer of the first host call that failed, if one did
};

/// What is known when the target has been halted after the failure.
struct KnownState {
    FlashWork flash = {};
    PhaseRecord phases = {};
    std::optional<NotBlank> notBlank = {};  ///< the first byte that a blank check has found
    UserRegisterWork registers = {};
    RegisterValues registerValues = {};  ///< read after the failure
    bool identified = true;              ///< the device was reached and its properties are known
    std::string advice = {};             ///< where it wasn't
    std::string doubt = {};              ///< why what was read doesn't count; `phases` do
    bool interrupted = false;
    bool haltFailed = false;
    bool traced = false;
};

/// The failure to throw. `members` is what the command adds to the JSON lines.
DeviceFailure MakeDeviceFailure(const FailedCall& call, const KnownState& state, Json members);
}  // namespace host
