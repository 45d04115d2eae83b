// The requests that don't just pass: a table, and one function for each.

#include <fmt/format.h>

#include <algorithm>

#include "base/Hex.h"
#include "target/gdb/probe/ProbeSession.h"
#include "target/gdb/server/Documents.h"
#include "target/gdb/server/SectionChecksum.h"

namespace target::gdb {

namespace {

constexpr std::uint32_t kPieceMax = 0x1000;

base::AddressRange RangeOf(std::uint32_t address, std::size_t size) {
    const std::uint64_t last = std::uint64_t{address} + std::max<std::size_t>(size, 1) - 1;
    return {address, static_cast<std::uint32_t>(std::min<std::uint64_t>(last, 0xFFFFFFFF))};
}

}  // namespace

struct ProbeSession::RequestRow {
    std::string_view name;
    ReadArguments read;
    Reply (ProbeSession::*answer)(const Arguments& arguments);
};

const ProbeSession::RequestRow* ProbeSession::FindRow(std::string_view payload) {
    static constexpr RequestRow kRows[] = {
        {"QStartNoAckMode", Nothing, &ProbeSession::StartNoAckMode},
        {"QNonStop:", Anything, &ProbeSession::Refuse},
        {"qXfer:memory-map:read::", Range, &ProbeSession::ReadMemoryMap},
        {"vFlashErase:", Range, &ProbeSession::EraseFlash},
        {"vFlashWrite:", FlashBytes, &ProbeSession::WriteFlash},
        {"vFlashDone", Nothing, &ProbeSession::FlashDone},
        {"qCRC:", Range, &ProbeSession::Checksum},
        {"qRcmd,", HexData, &ProbeSession::Monitor},
        {"m", Range, &ProbeSession::ReadMemory},
        {"x", Range, &ProbeSession::ReadBinary},
        {"M", HexBytes, &ProbeSession::WriteMemory},
        {"X", BinaryBytes, &ProbeSession::WriteMemory},
    };
    for (const RequestRow& row : kRows)
        if (payload.starts_with(row.name)) return &row;
    return nullptr;
}

ProbeSession::Reply ProbeSession::Answer(const std::string& payload) {
    const RequestRow* row = FindRow(payload);
    Arguments arguments;
    // What can't be understood is for the probe to refuse, but for what it never offered.
    if (row == nullptr) return std::nullopt;
    if (!row->read(std::string_view(payload).substr(row->name.size()), arguments))
        return row->name.starts_with("vFlash") ? Reply(kFailed) : std::nullopt;
    return (this->*row->answer)(arguments);
}

ProbeSession::Reply ProbeSession::StartNoAckMode(const Arguments&) {
    return kDone;
}

ProbeSession::Reply ProbeSession::Refuse(const Arguments&) {
    return "";
}

// All but the flash is memory of some kind: a debugger refuses addresses that no region has.
ProbeSession::Reply ProbeSession::ReadMemoryMap(const Arguments& arguments) {
    const MemoryRegion flash = Flash().Flash();
    const std::string document = MemoryDocument(
        {flash, {flash.address + flash.sizeBytes, 0U - (flash.address + flash.sizeBytes), 0}});
    return DocumentReply(document, arguments, features_.packetSize);
}

ProbeSession::Reply ProbeSession::EraseFlash(const Arguments& arguments) {
    FlashProgrammer& flash = Flash();
    const Own own(*this);
    flash.Erase(arguments.address, arguments.length);
    return kDone;
}

ProbeSession::Reply ProbeSession::WriteFlash(const Arguments& arguments) {
    FlashProgrammer& flash = Flash();
    const Own own(*this);
    flash.Write(arguments.address, arguments.data);
    if (!flash.HasWork()) return kDone;
    Borrow();
    flash.Work(stop_);
    return kDone;
}

ProbeSession::Reply ProbeSession::FlashDone(const Arguments&) {
    FlashProgrammer& flash = Flash();
    const Own own(*this);
    Borrow();
    flash.Done(stop_);
    GiveBack();
    return kDone;
}

bool ProbeSession::TouchesCollected(const Arguments& arguments) const {
    return flash_ && flash_->Touches(RangeOf(arguments.address, arguments.length));
}

bool ProbeSession::TouchesOwn(const Arguments& arguments) const {
    return TouchesCollected(arguments) ||
           (saved_ && saved_->Touches(RangeOf(arguments.address, arguments.length)));
}

std::string ProbeSession::ReadThrough(std::uint32_t address, std::uint32_t size) {
    std::string bytes(size, '\0');
    const Own own(*this);
    probe_.Read(bytes.data(), bytes.size(), address, 0, 1);
    if (flash_) flash_->Overlay(address, bytes);
    if (saved_) saved_->Overlay(address, bytes);
    return bytes;
}

ProbeSession::Reply ProbeSession::ReadMemory(const Arguments& arguments) {
    if (arguments.length == 0 || !TouchesOwn(arguments)) return std::nullopt;
    Settle();
    return base::ToHex(ReadThrough(arguments.address, std::min(arguments.length, kPieceMax)));
}

ProbeSession::Reply ProbeSession::ReadBinary(const Arguments& arguments) {
    if (TouchesOwn(arguments)) return "";
    return std::nullopt;
}

ProbeSession::Reply ProbeSession::WriteMemory(const Arguments& arguments) {
    if (arguments.length == 0 || !TouchesOwn(arguments)) return std::nullopt;
    if (TouchesCollected(arguments))
        throw TargetError(
            fmt::format("writing {} bytes at {:#x}: a debugger writes flash by its "
                        "load command",
                        arguments.length, arguments.address));
    Settle();
    saved_->Write(arguments.address, arguments.data);
    if (saved_->Holds(RangeOf(arguments.address, arguments.length))) return kDone;
    // Partly beside what is saved. What is there gets it with the rest, when that is put back.
    const Own own(*this);
    std::string bytes = arguments.data;
    probe_.Write(bytes.data(), bytes.size(), arguments.address, 0, 1);
    return kDone;
}

ProbeSession::Reply ProbeSession::Checksum(const Arguments& arguments) {
    if (arguments.length == 0 || !TouchesOwn(arguments)) return std::nullopt;
    Settle();
    return SectionChecksum(
        arguments.address, arguments.length,
        [this](std::uint32_t address, std::uint32_t size) { return ReadThrough(address, size); });
}

ProbeSession::Reply ProbeSession::Monitor(const Arguments& arguments) {
    if (arguments.data != "corvane") return std::nullopt;
    client_.Send("O" + base::ToHex(flash_ ? flash_->Report()
                                          : "No flash was asked for since you connected\n"));
    return kDone;
}

}  // namespace target::gdb
