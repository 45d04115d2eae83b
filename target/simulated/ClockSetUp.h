// ClockSetUp: how the oldest classes come from the clock that they wake up with to the one that
// their flash is erased and programmed with. Every setting is a write of the clock configuration
// register; the device takes it only in the one order that keeps the clock alive in between.
//
// What a write is goes by what it changes. Bits that belong to no setting must be kept.
//
//   stage        bypass    lock flag  source       repeat       divider       anything else
//   Unset        Bypassed  -          Unset        (a bypass)   Unset         Unset
//   Bypassed     Bypassed  Unlocked   Unset        (a bypass)   Unset         Unset
//   Unlocked     Bypassed  -          SourceAsked  (a bypass)   Unset         Unset
//   SourceAsked  Bypassed  -          Unset        SourceTaken  Unset         Unset
//   SourceTaken  Bypassed  Unlocked   Unset        (a bypass)   DividerAsked  Unset
//   DividerAsked Bypassed  -          Unset        Set          Unset         Unset
//   Set          Bypassed  Unlocked   Unset        (a bypass)   Unset         Unset
//
// A source or divider is first asked for and taken when the same word comes again, for the
// register crosses into another clock domain. Where nothing waits to be repeated, a repeated word
// is the bypass that it holds. Whoever was interrupted begins with a bypass again, from any stage.

#pragma once

#include <cstdint>

namespace target {

class ClockSetUp {
  public:
    enum class Stage { Unset, Bypassed, Unlocked, SourceAsked, SourceTaken, DividerAsked, Set };

    /// A write of the clock configuration register, which held `previous`.
    void Configure(std::uint32_t previous, std::uint32_t value);

    /// A write that ends the lock of the oscillator's last source.
    void ClearLockFlag();

    /// The clock was switched while it was in use: whatever was set is gone.
    void Lose() { stage_ = Stage::Unset; }

    bool IsSet() const { return stage_ == Stage::Set; }

  private:
    Stage stage_ = Stage::Unset;
};

}  // namespace target
