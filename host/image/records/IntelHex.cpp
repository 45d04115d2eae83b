// Intel HEX: ':' and, in pairs of digits, the number of data bytes, a 16-bit offset, the type, the
// data and a checksum that makes the sum of all zero.

#include <fmt/format.h>

#include <algorithm>
#include <array>

#include "base/ByteOrder.h"
#include "base/Hex.h"
#include "host/image/Formats.h"
#include "host/image/records/RecordReader.h"
#include "host/image/records/RecordRuns.h"
#include "host/image/records/RecordWriter.h"

namespace host::image {

namespace {

enum Type : std::uint8_t {
    kData,
    kEndOfFile,
    kSegmentBase,
    kSegmentStart,
    kLinearBase,
    kLinearStart,
    kTypeCount
};

constexpr std::size_t kAnyLength = 256;
constexpr std::array<std::size_t, kTypeCount> kDataLengths{kAnyLength, 0, 2, 4, 2, 4};

constexpr std::size_t kHeaderBytes = 4;
constexpr std::size_t kChecksumBytes = 1;

struct Record {
    std::uint8_t type;
    std::uint16_t offset;
    Bytes data;
};

std::uint8_t Checksum(Bytes bytes) {
    return static_cast<std::uint8_t>(-ByteSum(bytes));
}

class IntelHexReader {
  public:
    IntelHexReader(const std::string& contents, const std::string& name)
        : records_(contents, name), name_(name) {}

    Image Read() {
        while (!ended_ && records_.NextLine())
            Apply(ReadRecord());
        if (!ended_) {
            records_.Fail(
                "no end record (:00000001FF) found; the file is probably cut off: fetch "
                "or make it anew");
        }
        if (records_.NextLine()) {
            records_.FailHere(
                "more text found behind the end record; if several files were put "
                "together, give them one by one");
        }
        return runs_.Join(name_);
    }

  private:
    Record ReadRecord() {
        if (records_.Line()[0] != ':') {
            records_.FailHere(
                "no ':' found at the beginning, where each record of Intel HEX has "
                "one; remove the line or make the file anew");
        }
        const Bytes bytes = records_.DecodeFrom(1);
        records_.RequireSize(bytes.size(),
                             kHeaderBytes + (bytes.empty() ? 0U : bytes[0]) + kChecksumBytes);
        records_.RequireChecksum(bytes.back(), Checksum(bytes.first(bytes.size() - 1)));
        const Record record{bytes[3],
                            static_cast<std::uint16_t>(base::BigEndian(bytes.subspan(1, 2))),
                            bytes.subspan(kHeaderBytes, bytes[0])};
        RequireKnown(record);
        return record;
    }

    void RequireKnown(const Record& record) const {
        if (record.type >= kTypeCount) {
            records_.FailHere(
                fmt::format("record type {:02X} found, 00 to 05 expected; make the "
                            "file anew as plain Intel HEX",
                            record.type));
        }
        const std::size_t expected = kDataLengths[record.type];
        if (expected != kAnyLength && record.data.size() != expected) {
            records_.FailHere(fmt::format(
                "length {} found, {} expected in a record of type {:02X}; make the file anew",
                record.data.size(), expected, record.type));
        }
    }

    void Apply(const Record& record) {
        switch (record.type) {
            case kData:
                AddData(record);
                break;
            case kEndOfFile:
                ended_ = true;
                break;
            case kSegmentBase:
                segmented_ = true;
                base_ = base::BigEndian(record.data) << 4;
                break;
            case kLinearBase:
                segmented_ = false;
                base_ = base::BigEndian(record.data) << 16;
                break;
            default:  // where a processor would start doesn't matter to its flash
                break;
        }
    }

    /// Within a segment the offset wraps at 64 KiB, elsewhere the address at 4 GiB. Without any
    /// base record the file is taken as linear.
    void AddData(const Record& record) {
        const std::uint64_t wrapAt = segmented_ ? base_ + 0x1'0000ULL : 0x1'0000'0000ULL;
        const std::uint32_t wrapTo = segmented_ ? base_ : 0;
        const std::uint32_t address = base_ + record.offset;
        const std::size_t beforeWrap = std::min<std::size_t>(record.data.size(), wrapAt - address);
        runs_.Add(address, record.data.first(beforeWrap), records_.LineNumber());
        runs_.Add(wrapTo, record.data.subspan(beforeWrap), records_.LineNumber());
    }

    RecordReader records_;
    const std::string& name_;
    RecordRuns runs_;
    std::uint32_t base_ = 0;
    bool segmented_ = false;
    bool ended_ = false;
};

void AppendRecord(std::string& text, const Record& record) {
    std::array<std::uint8_t, kHeaderBytes + kRecordDataBytes + kChecksumBytes> bytes{
        static_cast<std::uint8_t>(record.data.size()),
        static_cast<std::uint8_t>(record.offset >> 8), static_cast<std::uint8_t>(record.offset),
        record.type};
    const std::size_t size = kHeaderBytes + record.data.size();
    std::ranges::copy(record.data, bytes.begin() + kHeaderBytes);
    bytes[size] = Checksum(Bytes(bytes).first(size));
    text += ':';
    base::AppendHex(text, Bytes(bytes).first(size + kChecksumBytes));
    text += '\n';
}

}  // namespace

Image ParseIntelHex(const std::string& contents, const std::string& name) {
    return IntelHexReader(contents, name).Read();
}

std::string FormatIntelHex(const Image& image) {
    std::string text;
    std::uint32_t upperHalf = 0;
    ForEachRecord(image, [&](std::uint32_t address, Bytes data) {
        if (address >> 16 != upperHalf) {
            upperHalf = address >> 16;
            const std::array<std::uint8_t, 2> base{static_cast<std::uint8_t>(upperHalf >> 8),
                                                   static_cast<std::uint8_t>(upperHalf)};
            AppendRecord(text, {kLinearBase, 0, base});
        }
        AppendRecord(text, {kData, static_cast<std::uint16_t>(address), data});
    });
    AppendRecord(text, {kEndOfFile, 0, {}});
    return text;
}

}  // namespace host::image
