// Writing the user registers, or the MAC address that they hold, with what they were before and are
// afterwards: a command of its own, or the end of a load.

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "host/base/MacAddress.h"
#include "host/commands/SharedOptions.h"

namespace host::commands {

/// Read through the plug-in; the host has padded it to two digits a byte.
std::string ReadMac(FlashDevice& device);

/// Failure (WrongUsage) for a text that is no address, and for one that no device should have.
MacAddress RequireMac(const std::string& text, const AnyAddress& any);

Outcome WriteMac(Context& context, FlashDevice& device, const MacAddress& mac, bool commit);

Outcome WriteRegister(Context& context, FlashDevice& device, unsigned index, std::uint32_t value,
                      bool commit);

/// What a load writes besides the flash.
struct RegisterOptionsOfLoad : Committing, AnyAddress {
    std::optional<std::string> mac;
    std::vector<std::string> registers;  ///< as INDEX=VALUE
};

/// The same as values: an address, or registers, or nothing.
struct WantedRegisters {
    std::optional<MacAddress> mac;
    std::vector<std::pair<unsigned, std::uint32_t>> registers;
    bool commit = false;

    bool Empty() const { return !mac && registers.empty(); }
};

/// Failure (WrongUsage) for options that aren't right, or don't go together.
WantedRegisters RequireRegisters(const RegisterOptionsOfLoad& options);

/// "MAC address 02-1b-c3-04-05-06", "user register 0 0x000012ab": what a plan says of them.
std::vector<std::string> Describe(const WantedRegisters& wanted);

/// Writes them after a load, whose outcome it goes on with.
void WriteAfterLoad(Context& context, FlashDevice& device, const WantedRegisters& wanted,
                    Outcome& load);

}  // namespace host::commands
