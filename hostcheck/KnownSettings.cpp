#include "hostcheck/KnownSettings.h"

#include "device/SettingKeys.h"

namespace hostcheck {

namespace {

// A load erases and sums up as well, and says more when it is asked to.
constexpr unsigned kVerbose = kLoad | kErase | kBlankCheck | kChecksum;

constexpr KnownSetting kSettings[] = {
    {Setting::FlashProgramOption, Form::EraseOption, kLoad},
    {Setting::FlashProgramBlankCheckOption, Form::Switch, kLoad},
    {Setting::FlashProgramCRCOption, Form::Switch, kLoad},
    {Setting::FlashResetSetting, Form::Switch, kLoad | kErase},
    {Setting::FlashTimeoutValue, Form::Seconds, kLoad},
    {Setting::FlashVerboseMode, Form::Integer, kVerbose},
    {Setting::FlashCrystalFreq, Form::Crystal, 0},
    {Setting::FlashEraseType, Form::Selection, kErase},
    {Setting::FlashEraseStartAddr, Form::Address, kErase},
    {Setting::FlashEraseEndAddr, Form::Address, kErase},
    {Setting::FlashBlankCheckSelection, Form::Selection, kBlankCheck},
    {Setting::FlashBlankCheckStartAddr, Form::Address, kBlankCheck},
    {Setting::FlashBlankCheckEndAddr, Form::Address, kBlankCheck},
    {Setting::FlashChecksumSelection, Form::Selection, kChecksum},
    {Setting::FlashChecksumStartAddr, Form::Address, kChecksum},
    {Setting::FlashChecksumEndAddr, Form::Address, kChecksum},
    {Setting::FlashUserRegisterInput[0], Form::Address, kProgramRegister0},
    {Setting::FlashUserRegisterCommit[0], Form::Address, kProgramRegister0},
    {Setting::FlashUserRegisterInput[1], Form::Address, kProgramRegister1},
    {Setting::FlashUserRegisterCommit[1], Form::Address, kProgramRegister1},
    {Setting::FlashMACAddrInput, Form::Mac, kProgramMac},
    {Setting::FlashMACAddrCommit, Form::Address, kProgramMac},
};

}  // namespace

std::span<const KnownSetting> KnownSettings() {
    return kSettings;
}

}  // namespace hostcheck
