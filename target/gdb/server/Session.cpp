// The table of requests, and one function for each kind of them.

#include "target/gdb/server/Session.h"

#include <fmt/format.h>

#include <algorithm>
#include <utility>

#include "base/ByteOrder.h"
#include "base/Hex.h"
#include "target/gdb/server/Documents.h"
#include "target/gdb/server/SectionChecksum.h"
#include "target/gdb/wire/Frame.h"

namespace target::gdb {

namespace {

constexpr char kOk[] = "OK";
constexpr char kRefused[] = "E01";
constexpr char kUnknown[] = "";
constexpr char kVersion[] = "corvane-flash: a simulated device\n";
constexpr char kStopped[] = "T05thread:1;";
constexpr char kInterrupted[] = "T02thread:1;";

constexpr char kMonitorHelp[] =
    "halt         stop the device\n"
    "resume       let the device go on\n"
    "reset        reset the device and let it run; also reset run\n"
    "reset halt   reset the device and leave it halted; also reset init\n"
    "version      who this server is\n"
    "help         this list\n";

// What fits the reply's packet.
constexpr std::uint32_t kReadMax = Session::kPacketSize / 2;

// Registers take nothing but whole words; a debugger asks for them as it does for any memory.
std::size_t WidthOf(std::uint32_t address, std::size_t sizeBytes) {
    return address % 4 == 0 && sizeBytes % 4 == 0 ? 4 : 1;
}

constexpr char kResumeKinds[] = "vCont;c;C;s;S";
constexpr char kFirstThreads[] = "m1";
constexpr char kNoMoreThreads[] = "l";
constexpr char kCurrentThread[] = "QC1";
constexpr char kAttached[] = "1";

}  // namespace

/// What a client can ask: adding a request is adding a row.
struct Session::RequestRow {
    std::string_view name;
    ReadArguments read;
    Replies (Session::*answer)(const Arguments& arguments);
};

template <const char* Reply>
Session::Replies Session::Always(const Arguments&) {
    return {Reply};
}

const Session::RequestRow* Session::FindRow(std::string_view payload) {
    // A name that another one begins with stands behind that.
    static constexpr RequestRow kRows[] = {
        {"qSupported", Anything, &Session::Supported},
        {"QStartNoAckMode", Nothing, &Session::StartNoAckMode},
        {"qXfer:", Document, &Session::ReadDocument},
        {"qCRC:", Range, &Session::Checksum},
        {"qRcmd,", HexData, &Session::Monitor},
        {"qfThreadInfo", Nothing, &Session::Always<kFirstThreads>},
        {"qsThreadInfo", Nothing, &Session::Always<kNoMoreThreads>},
        {"qC", Nothing, &Session::Always<kCurrentThread>},
        {"qAttached", Anything, &Session::Always<kAttached>},
        {"qSymbol:", Anything, &Session::Always<kOk>},
        {"vFlashErase:", Range, &Session::EraseFlash},
        {"vFlashWrite:", FlashBytes, &Session::WriteFlash},
        {"vFlashDone", Nothing, &Session::Always<kOk>},
        {"vCont?", Nothing, &Session::Always<kResumeKinds>},
        {"vCont;", FirstAction, &Session::Resume},
        {"?", Nothing, &Session::WhyStopped},
        {"g", Nothing, &Session::ReadRegisters},
        {"G", HexData, &Session::WriteRegisters},
        {"p", RegisterNumber, &Session::ReadRegister},
        {"P", RegisterValue, &Session::WriteRegister},
        {"m", Range, &Session::ReadMemory},
        {"M", HexBytes, &Session::WriteMemory},
        {"X", BinaryBytes, &Session::WriteMemory},
        // Code doesn't run, so nothing ever comes to a breakpoint.
        {"Z", Breakpoint, &Session::Always<kOk>},
        {"z", Breakpoint, &Session::Always<kOk>},
        {"c", OptionalAddress, &Session::Continue},
        {"s", OptionalAddress, &Session::Step},
        {"H", Anything, &Session::Always<kOk>},
        {"T", Anything, &Session::Always<kOk>},
        {"D", Anything, &Session::Detach},
        {"k", Nothing, &Session::Kill},
    };
    for (const RequestRow& row : kRows)
        if (payload.starts_with(row.name)) return &row;
    return nullptr;
}

std::vector<std::string> Session::Answer(std::string_view payload) {
    const RequestRow* row = FindRow(payload);
    Arguments arguments;
    if (row != nullptr && !row->read(payload.substr(row->name.size()), arguments))
        return {Refuse(fmt::format("the request {} is malformed", row->name))};
    const bool ends = row != nullptr && row->answer == &Session::Kill;
    if (awaitsStop_ && !ends)
        return {Refuse("the target is running; it takes nothing but an interrupt")};
    if (row == nullptr) return {kUnknown};
    try {
        return (this->*row->answer)(arguments);
    } catch (const TargetError& error) {
        return {Refuse(error.what())};
    }
}

Session::Replies Session::Supported(const Arguments&) {
    return {
        fmt::format("PacketSize={:x};QStartNoAckMode+;qXfer:features:read+;"
                    "qXfer:memory-map:read+;vContSupported+",
                    kPacketSize)};
}

Session::Replies Session::StartNoAckMode(const Arguments&) {
    acknowledges_ = false;
    return {kOk};
}

// A debugger asks this first, and takes the target for stopped from then on.
Session::Replies Session::WhyStopped(const Arguments&) {
    device_.Stop();
    interruptKept_ = false;
    return {kStopped};
}

Session::Replies Session::ReadRegisters(const Arguments&) {
    std::string bytes;
    for (const std::uint32_t value : device_.Registers().values)
        bytes += base::WordBytes(value);
    return {base::ToHex(bytes)};
}

// Answered by the stop, which only an interrupt brings about: the core executes nothing.
Session::Replies Session::Continue(const Arguments& arguments) {
    GoTo(arguments);
    stepped_ = false;
    if (std::exchange(interruptKept_, false)) return {kInterrupted};
    device_.Start();
    awaitsStop_ = true;
    return {};
}

// No step gets anywhere. A debugger that steps until it comes to another line would do so for ever;
// told of an interrupt, it gives up.
Session::Replies Session::Step(const Arguments& arguments) {
    GoTo(arguments);
    stepped_ = true;
    interruptKept_ = false;
    return {kInterrupted};
}

Session::Replies Session::Resume(const Arguments& arguments) {
    return arguments.step ? Step(arguments) : Continue(arguments);
}

Session::Replies Session::EraseFlash(const Arguments& arguments) {
    device_.EraseFlash(arguments.address, arguments.length);
    return {kOk};
}

Session::Replies Session::WriteFlash(const Arguments& arguments) {
    device_.ProgramFlash(arguments.address, arguments.data);
    return {kOk};
}

// Debuggers expect a target that they have left to run.
Session::Replies Session::Detach(const Arguments&) {
    device_.Start();
    ended_ = true;
    return {kOk};
}

Session::Replies Session::Kill(const Arguments&) {
    device_.Reset();
    ended_ = true;
    return {};
}

std::vector<std::string> Session::Interrupt() {
    // Between the steps of one command of the user's, it is meant for the next of them.
    if (!awaitsStop_) {
        interruptKept_ = stepped_;
        return {};
    }
    awaitsStop_ = false;
    try {
        device_.Stop();
    } catch (const TargetError& error) {
        return {Refuse(error.what())};
    }
    return {kInterrupted};
}

void Session::GoTo(const Arguments& arguments) {
    if (arguments.hasAddress) device_.Registers().values[CoreRegisters::kPc] = arguments.address;
}

Session::Replies Session::ReadMemory(const Arguments& arguments) {
    if (arguments.length == 0) return {Refuse("a read of no bytes")};
    const std::uint32_t size = std::min(arguments.length, kReadMax);
    return {base::ToHex(device_.Read(arguments.address, size, WidthOf(arguments.address, size)))};
}

Session::Replies Session::WriteMemory(const Arguments& arguments) {
    if (!arguments.data.empty())
        device_.Write(arguments.address, arguments.data,
                      WidthOf(arguments.address, arguments.length));
    return {kOk};
}

Session::Replies Session::Checksum(const Arguments& arguments) {
    return {SectionChecksum(arguments.address, arguments.length,
                            [this](std::uint32_t address, std::uint32_t size) {
                                return device_.Read(address, size, WidthOf(address, size));
                            })};
}

Session::Replies Session::ReadDocument(const Arguments& arguments) {
    std::string document;
    if (arguments.name == "features:target.xml")
        document = RegistersDocument();
    else if (arguments.name == "memory-map:")
        document = MemoryDocument(device_.Regions());
    else
        return {"E00"};
    return {DocumentReply(document, arguments, kPacketSize)};
}

Session::Replies Session::ReadRegister(const Arguments& arguments) {
    if (arguments.address >= CoreRegisters::kCount) return {kRefused};
    return {base::ToHex(base::WordBytes(device_.Registers().values[arguments.address]))};
}

Session::Replies Session::WriteRegister(const Arguments& arguments) {
    if (arguments.address >= CoreRegisters::kCount || arguments.data.size() != 4) return {kRefused};
    device_.Registers().values[arguments.address] = base::WordOf(arguments.data);
    return {kOk};
}

Session::Replies Session::WriteRegisters(const Arguments& arguments) {
    CoreRegisters& registers = device_.Registers();
    if (arguments.data.size() != sizeof registers.values) return {kRefused};
    for (std::size_t i = 0; i < CoreRegisters::kCount; ++i)
        registers.values[i] = base::WordOf(std::string_view(arguments.data).substr(4 * i, 4));
    return {kOk};
}

Session::Replies Session::Monitor(const Arguments& arguments) {
    const std::string& command = arguments.data;
    if (command.starts_with("reset") || command == "halt" || command == "resume") {
        if (const auto reply = Control(command)) return {*reply};
    }
    if (command == "version") return {"O" + base::ToHex(kVersion), kOk};
    const bool help = command == "help";
    const std::string text =
        help ? kMonitorHelp
             : fmt::format("no monitor command '{}'; there are:\n{}", command, kMonitorHelp);
    return {"O" + base::ToHex(text), help ? kOk : kRefused};
}

/// The commands that start and stop the device; nothing for one that isn't among them.
std::optional<std::string> Session::Control(const std::string& command) {
    const bool resets = command == "reset" || command == "reset run";
    if (resets || command == "reset halt" || command == "reset init")
        device_.Reset();
    else if (command == "halt")
        device_.Stop();
    else if (command != "resume")
        return std::nullopt;
    if (resets || command == "resume") device_.Start();
    return kOk;
}

std::string Session::Refuse(const std::string& why) {
    complain_(why);
    return kRefused;
}

}  // namespace target::gdb
