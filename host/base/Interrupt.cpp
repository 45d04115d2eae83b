// What has caught a signal, and what else may interrupt.

#include "host/base/Interrupt.h"

#include <utility>

#include "base/system/Signals.h"
#include "host/base/Errors.h"

namespace host {

namespace {

InterruptSource* otherSource = nullptr;

}  // namespace

bool Interrupted() {
    return base::HasCaughtSignal() || (otherSource != nullptr && otherSource->HasInterrupted());
}

InterruptSource::InterruptSource(std::function<bool()> asked) : asked_(std::move(asked)) {
    otherSource = this;
}

InterruptSource::~InterruptSource() {
    otherSource = nullptr;
}

bool InterruptSource::HasInterrupted() {
    // Whoever is asked may wait for something itself, and so ask whether to go on.
    if (std::exchange(asking_, true)) return interrupted_;
    interrupted_ = interrupted_ || asked_();
    asking_ = false;
    return interrupted_;
}

void ThrowIfInterrupted() {
    if (Interrupted()) throw Failure(ExitStatus::Interrupted, "interrupted");
}

}  // namespace host
