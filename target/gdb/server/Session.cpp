// One function for each kind of request.

#include "target/gdb/server/Session.h"

#include <fmt/format.h>

#include <algorithm>

#include "base/ByteOrder.h"
#include "base/Hex.h"
#include "target/gdb/server/Documents.h"
#include "target/gdb/wire/Frame.h"

namespace target::gdb {

namespace {

using Kind = Request::Kind;

constexpr char kOk[] = "OK";
constexpr char kRefused[] = "E01";
constexpr char kUnknown[] = "";
constexpr char kStopped[] = "T05thread:1;";
constexpr char kInterrupted[] = "T02thread:1;";

constexpr char kMonitorHelp[] =
    "reset        reset the device and let it run\n"
    "reset halt   reset the device and leave it halted\n"
    "help         this list\n";

// What fits the reply's packet.
constexpr std::uint32_t kReadMax = (Session::kPacketSize - kFrameSize) / 2;

std::size_t WidthOf(std::uint32_t address, std::size_t sizeBytes) {
    return address % 4 == 0 && sizeBytes % 4 == 0 ? 4 : 1;
}

/// The checksum of "compare-sections": CRC-32 from the top bit down, without any inversion.
std::uint32_t AddToChecksum(std::uint32_t crc, std::string_view bytes) {
    for (const char byte : bytes) {
        crc ^= std::uint32_t{static_cast<unsigned char>(byte)} << 24;
        for (int bit = 0; bit < 8; ++bit)
            crc = crc << 1 ^ ((crc & 0x80000000) != 0 ? 0x04C11DB7 : 0);
    }
    return crc;
}

}  // namespace

std::vector<std::string> Session::Answer(std::string_view payload) {
    const Request request = ParseRequest(payload);
    if (request.malformed)
        return {Refuse(fmt::format("the request {} is malformed", request.name))};
    if (awaitsStop_ && request.kind != Kind::Kill)
        return {Refuse("the target is running; it takes nothing but an interrupt")};
    try {
        return Carry(request);
    } catch (const TargetError& error) {
        return {Refuse(error.what())};
    }
}

std::vector<std::string> Session::Carry(const Request& request) {
    switch (request.kind) {
        case Kind::Supported:
            return {
                fmt::format("PacketSize={:x};QStartNoAckMode+;qXfer:features:read+;"
                            "qXfer:memory-map:read+;vContSupported+",
                            kPacketSize)};
        case Kind::StartNoAckMode:
            acknowledges_ = false;
            return {kOk};
        case Kind::WhyStopped:
            device_.Stop();
            return {kStopped};
        case Kind::ReadRegisters: {
            std::string bytes;
            for (const std::uint32_t value : device_.Registers().values)
                bytes += base::WordBytes(value);
            return {base::ToHex(bytes)};
        }
        case Kind::WriteRegisters:
            return {WriteRegisters(request)};
        case Kind::ReadRegister:
            return {ReadRegister(request)};
        case Kind::WriteRegister:
            return {WriteRegister(request)};
        case Kind::ReadMemory:
            return {ReadMemory(request)};
        case Kind::WriteMemory:
            return {WriteMemory(request)};
        case Kind::Continue:
            GoTo(request);
            device_.Start();
            awaitsStop_ = true;
            return {};
        case Kind::Step:
            GoTo(request);
            return {kStopped};
        case Kind::ResumeKinds:
            return {"vCont;c;C;s;S"};
        case Kind::Checksum:
            return {Checksum(request)};
        case Kind::ReadDocument:
            return {ReadDocument(request)};
        case Kind::EraseFlash:
            device_.EraseFlash(request.address, request.length);
            return {kOk};
        case Kind::WriteFlash:
            device_.ProgramFlash(request.address, request.data);
            return {kOk};
        case Kind::Monitor:
            return Monitor(request.data);
        case Kind::FirstThreads:
            return {"m1"};
        case Kind::MoreThreads:
            return {"l"};
        case Kind::CurrentThread:
            return {"QC1"};
        case Kind::Attached:
            return {"1"};
        case Kind::FinishFlash:
        case Kind::ChooseThread:
        case Kind::ThreadAlive:
        case Kind::Symbols:
            return {kOk};
        case Kind::Detach:
            device_.Start();
            ended_ = true;
            return {kOk};
        case Kind::Kill:
            device_.Reset();
            ended_ = true;
            return {};
        case Kind::Unknown:
            break;
    }
    return {kUnknown};
}

std::vector<std::string> Session::Interrupt() {
    if (!awaitsStop_) return {};
    awaitsStop_ = false;
    try {
        device_.Stop();
    } catch (const TargetError& error) {
        return {Refuse(error.what())};
    }
    return {kInterrupted};
}

void Session::GoTo(const Request& request) {
    if (request.hasAddress) device_.Registers().values[CoreRegisters::kPc] = request.address;
}

std::string Session::ReadMemory(const Request& request) {
    if (request.length > kReadMax) return Refuse("more memory was asked for than fits a packet");
    return base::ToHex(
        device_.Read(request.address, request.length, WidthOf(request.address, request.length)));
}

std::string Session::WriteMemory(const Request& request) {
    if (!request.data.empty())
        device_.Write(request.address, request.data, WidthOf(request.address, request.length));
    return kOk;
}

std::string Session::Checksum(const Request& request) {
    constexpr std::uint32_t kPieceSize = 4096;
    std::uint32_t crc = 0xFFFFFFFF;
    for (std::uint32_t done = 0; done < request.length;) {
        const std::uint32_t size = std::min(kPieceSize, request.length - done);
        crc = AddToChecksum(
            crc, device_.Read(request.address + done, size, WidthOf(request.address + done, size)));
        done += size;
    }
    return fmt::format("C{:x}", crc);
}

std::string Session::ReadDocument(const Request& request) const {
    std::string document;
    if (request.name == "features:target.xml")
        document = RegistersDocument();
    else if (request.name == "memory-map:")
        document = MemoryDocument(device_.Regions());
    else
        return "E00";
    const std::size_t offset = std::min<std::size_t>(request.address, document.size());
    const std::size_t room = (kPacketSize - kFrameSize - 1) / 2;
    const std::size_t size = std::min<std::size_t>(request.length, room);
    const bool last = document.size() - offset <= size;
    return (last ? "l" : "m") + Escaped(std::string_view(document).substr(offset, size));
}

std::string Session::ReadRegister(const Request& request) {
    if (request.address >= CoreRegisters::kCount) return kRefused;
    return base::ToHex(base::WordBytes(device_.Registers().values[request.address]));
}

std::string Session::WriteRegister(const Request& request) {
    if (request.address >= CoreRegisters::kCount || request.data.size() != 4) return kRefused;
    device_.Registers().values[request.address] = base::WordOf(request.data);
    return kOk;
}

std::string Session::WriteRegisters(const Request& request) {
    CoreRegisters& registers = device_.Registers();
    if (request.data.size() != sizeof registers.values) return kRefused;
    for (std::size_t i = 0; i < CoreRegisters::kCount; ++i)
        registers.values[i] = base::WordOf(std::string_view(request.data).substr(4 * i, 4));
    return kOk;
}

std::vector<std::string> Session::Monitor(const std::string& command) {
    if (command == "reset halt" || command == "reset") {
        device_.Reset();
        if (command == "reset") device_.Start();
        return {kOk};
    }
    const bool help = command == "help";
    const std::string text =
        help ? kMonitorHelp
             : fmt::format("no monitor command '{}'; there are:\n{}", command, kMonitorHelp);
    return {"O" + base::ToHex(text), help ? kOk : kRefused};
}

std::string Session::Refuse(const std::string& why) {
    complain_(why);
    return kRefused;
}

}  // namespace target::gdb
