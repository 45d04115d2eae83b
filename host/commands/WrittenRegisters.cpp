// Each is read before and afterwards; what is said is what was read.

#include "host/commands/WrittenRegisters.h"

#include <fmt/format.h>

#include "base/Hex.h"
#include "host/driver/FlashDevice.h"
#include "host/facts/SettingKeys.h"
#include "host/flashing/UserRegisters.h"

namespace host::commands {

namespace {

std::pair<unsigned, std::uint32_t> RequireRegister(const std::string& text) {
    const bool isIndexed = text.starts_with("0=") || text.starts_with("1=");
    if (!isIndexed)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("--register takes 0=VALUE or 1=VALUE, not '{}'", text));
    return {text.front() - '0', ParseHexArgument(text.substr(2), "the register's value")};
}

void RefuseContradictions(const RegisterOptionsOfLoad& options) {
    const char* wrong = nullptr;
    if (options.mac && !options.registers.empty())
        wrong = "--mac writes both user registers; leave --register out";
    else if (options.anyAddress && !options.mac)
        wrong = "--any-address is for --mac";
    else if (options.commit && !options.mac && options.registers.empty())
        wrong = "--commit is for --mac and --register; flash needs none";
    else if (options.registers.size() == 2 && options.registers[0][0] == options.registers[1][0])
        wrong = "--register names the same register twice; leave one out";
    else if (options.registers.size() > 2)
        wrong = "there are two user registers, and --register is there more often";
    if (wrong != nullptr) throw Failure(ExitStatus::WrongUsage, wrong);
}

/// The first that fails is what the load ends with; those behind it aren't written.
void Add(Outcome& load, const Outcome& written) {
    load.result["userRegisters"].push_back(written.result);
    load.status = written.status;
    if (!written.error.empty())
        load.error = fmt::format("the flash holds the image, but {}", written.error);
}

}  // namespace

std::string ReadMac(FlashDevice& device) {
    device.Perform(plugin::kReadMac, Verbosity::Verbose);
    return device.Published(keys::kMacInput);
}

MacAddress RequireMac(const std::string& text, const AnyAddress& any) {
    const auto mac = ParseMacAddress(text);
    if (!mac)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("'{}' is no MAC address; write six hexadecimal bytes, as in "
                                  "02-1b-c3-04-05-06, 2:1b:c3:4:5:6 or 021bc3040506",
                                  text));
    const std::string objection = mac->Objection();
    if (!objection.empty() && !any.anyAddress)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("{} {}; no device should have it; --any-address programs it "
                                  "all the same",
                                  text, objection));
    return *mac;
}

Outcome WriteMac(Context& context, FlashDevice& device, const MacAddress& mac, bool commit) {
    const std::string old = ReadMac(device);
    context.settings.Set(Origin::CommandLine, keys::kMacInput, mac.Text());
    ChooseCommit(context.settings, context.reporter, keys::kMacCommit, commit);
    device.Perform(plugin::kProgramMac);
    Outcome outcome;
    const RegisterValues values =
        CheckRegisters(device, {mac.Register(0), mac.Register(1)}, outcome);
    const std::string now = MacAddress::FromRegisters(*values[0], *values[1]).Text();
    context.reporter.Result(fmt::format("MAC address: was {}, is {}", old, now));
    outcome.result.update({{"old", old}, {"mac", now}});
    SayWhetherCommitted(context.reporter, device.UserRegisters(), outcome);
    return outcome;
}

Outcome WriteRegister(Context& context, FlashDevice& device, unsigned index, std::uint32_t value,
                      bool commit) {
    const std::uint32_t old = ReadRegister(device, index);
    context.settings.Set(Origin::CommandLine, keys::kRegisterInputs[index], base::HexText(value));
    ChooseCommit(context.settings, context.reporter, keys::kRegisterCommits[index], commit);
    device.Perform(plugin::ProgramRegisterOperation(index));
    Outcome outcome;
    RegisterValues expected;
    expected.at(index) = value;
    const std::uint32_t now = *CheckRegisters(device, expected, outcome).at(index);
    context.reporter.Result(
        fmt::format("User register {}: was {:#010x}, is {:#010x}", index, old, now));
    outcome.result.update({{"register", index}, {"old", old}, {"value", now}});
    SayWhetherCommitted(context.reporter, device.UserRegisters(), outcome);
    return outcome;
}

WantedRegisters RequireRegisters(const RegisterOptionsOfLoad& options) {
    WantedRegisters wanted;
    for (const std::string& text : options.registers)
        wanted.registers.push_back(RequireRegister(text));
    RefuseContradictions(options);
    if (options.mac) wanted.mac = RequireMac(*options.mac, options);
    wanted.commit = options.commit;
    return wanted;
}

std::vector<std::string> Describe(const WantedRegisters& wanted) {
    std::vector<std::string> texts;
    if (wanted.mac) texts.push_back("MAC address " + wanted.mac->Text());
    for (const auto& [index, value] : wanted.registers)
        texts.push_back(fmt::format("user register {} {:#010x}", index, value));
    return texts;
}

void WriteAfterLoad(Context& context, FlashDevice& device, const WantedRegisters& wanted,
                    Outcome& load) {
    if (wanted.Empty()) return;
    load.result["userRegisters"] = Json::array();
    if (wanted.mac) Add(load, WriteMac(context, device, *wanted.mac, wanted.commit));
    for (const auto& [index, value] : wanted.registers)
        if (load.status == ExitStatus::Done)
            Add(load, WriteRegister(context, device, index, value, wanted.commit));
}

}  // namespace host::commands
