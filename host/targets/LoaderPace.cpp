// Two bounds, and what each look makes of them.

#include "host/targets/LoaderPace.h"

#include <algorithm>

namespace host {

namespace {

/// A share of a chunk's costs that nobody misses.
constexpr int kMarginShare = 16;

/// A step beyond a chunk's time so far, while nothing is known of it.
constexpr int kStepShare = 8;

/// No chunk takes longer, and a loader that hangs may be looked at for hours.
constexpr LoaderPace::Time kStepMax = std::chrono::minutes(1);

/// How slowly the lower bound begins to sink: a look in vain now and then is cheaper than to miss
/// that the flash has become faster.
constexpr int kSinkingShare = 1024;

}  // namespace

LoaderPace::Time LoaderPace::Margin() const {
    return (lookTime_ + most_.value_or(least_)) / kMarginShare;
}

LoaderPace::Time LoaderPace::Guess() const {
    if (!most_) return least_ + step_;
    if (tooEarly_ || *most_ - least_ <= Margin()) return *most_;
    return (least_ + *most_) / 2;
}

void LoaderPace::Pending(Time ran) {
    least_ = std::max(least_, ran);
    tooEarly_ = true;
    sinking_ = Time::zero();
    if (most_ && least_ < *most_) return;
    if (most_) step_ = Time::zero();
    most_.reset();
    step_ = known_ ? std::max(2 * step_, Margin()) : std::max(least_ / kStepShare, lookTime_);
    step_ = std::min(step_, kStepMax);
}

void LoaderPace::Done(Time ran) {
    most_ = std::min(most_.value_or(ran), ran);
    known_ = true;
    tooEarly_ = false;
    sinking_ = std::min(std::max(sinking_ + sinking_ / 4, Margin() / kSinkingShare), *most_);
    least_ = std::clamp(least_ - sinking_, Time::zero(), *most_);
}

}  // namespace host
