// S-records: 'S', the type, and, in pairs of digits, the number of bytes that follow, an address of
// two to four bytes, the data and a checksum that makes the sum of all 0xFF.

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

enum class Kind { Header, Data, Reserved, Count, Termination };

struct Type {
    Kind kind;
    std::size_t addressBytes;
};

constexpr std::array<Type, 10> kTypes{{
    {Kind::Header, 2},
    {Kind::Data, 2},
    {Kind::Data, 3},
    {Kind::Data, 4},
    {Kind::Reserved, 0},
    {Kind::Count, 2},
    {Kind::Count, 3},
    {Kind::Termination, 4},
    {Kind::Termination, 3},
    {Kind::Termination, 2},
}};

constexpr std::size_t kLengthBytes = 1;
constexpr std::size_t kChecksumBytes = 1;

struct Record {
    char type;
    std::uint32_t address;
    Bytes data;
};

const Type& TypeOf(char digit) {
    return kTypes[static_cast<std::size_t>(digit - '0')];
}

std::uint8_t Checksum(Bytes bytes) {
    return static_cast<std::uint8_t>(~ByteSum(bytes));
}

class SRecordReader {
  public:
    SRecordReader(const std::string& contents, const std::string& name)
        : records_(contents, name), name_(name) {}

    /// Many tools leave the termination record out when there is no start address to put into it,
    /// others leave out the count. One of the two must stand behind the last data: else a file that
    /// was cut off between two lines would be taken for a whole one.
    Image Read() {
        while (!terminated_ && records_.NextLine())
            Apply(ReadRecord());
        if (!complete_) {
            records_.Fail(
                "neither a count (S5, S6) nor a termination record (S7 to S9) found "
                "behind the data; the file is probably cut off: fetch or make it anew, "
                "or add the line S9030000FC if nothing is missing");
        }
        if (records_.NextLine()) {
            records_.FailHere(
                "more text found behind the termination record; if several files "
                "were put together, give them one by one");
        }
        return runs_.Join(name_);
    }

  private:
    Record ReadRecord() {
        const char type = ReadType();
        const Bytes bytes = records_.DecodeFrom(2);
        records_.RequireSize(bytes.size(), kLengthBytes + (bytes.empty() ? 0U : bytes[0]));
        const Bytes summed = bytes.first(bytes.size() - kChecksumBytes);
        records_.RequireChecksum(bytes.back(), Checksum(summed));
        RequireBody(type, summed.size() - kLengthBytes);
        const std::size_t addressBytes = TypeOf(type).addressBytes;
        return {type, base::BigEndian(summed.subspan(kLengthBytes, addressBytes)),
                summed.subspan(kLengthBytes + addressBytes)};
    }

    char ReadType() const {
        const std::string_view line = records_.Line();
        if (line.size() < 2 || line[0] != 'S' || line[1] < '0' || line[1] > '9' ||
            TypeOf(line[1]).kind == Kind::Reserved) {
            records_.FailHere(
                "a line found that begins with none of S0 to S3 and S5 to S9; remove "
                "it or make the file anew");
        }
        return line[1];
    }

    void RequireBody(char type, std::size_t found) const {
        const auto [kind, addressBytes] = TypeOf(type);
        const bool dataAllowed = kind == Kind::Header || kind == Kind::Data;
        if (found == addressBytes || (found > addressBytes && dataAllowed)) return;
        records_.FailHere(
            fmt::format("address and data: {} bytes found, {} expected in an S{} "
                        "record; make the file anew",
                        found, addressBytes, type));
    }

    void Apply(const Record& record) {
        switch (TypeOf(record.type).kind) {
            case Kind::Data:
                runs_.Add(record.address, record.data, records_.LineNumber());
                ++dataRecords_;
                complete_ = false;
                break;
            case Kind::Count:
                RequireCount(record);
                complete_ = true;
                break;
            case Kind::Termination:
                complete_ = terminated_ = true;
                break;
            case Kind::Header:
            case Kind::Reserved:
                break;
        }
    }

    /// A count that outgrows its record wraps: tools write it so, and take it so.
    void RequireCount(const Record& record) const {
        const std::size_t wrapAt = std::size_t{1} << 8 * TypeOf(record.type).addressBytes;
        if (record.address == dataRecords_ % wrapAt) return;
        records_.FailHere(
            fmt::format("data records: {} found, {} expected by this count; lines are missing or "
                        "doubled: fetch or make the file anew",
                        dataRecords_, record.address));
    }

    RecordReader records_;
    const std::string& name_;
    RecordRuns runs_;
    std::size_t dataRecords_ = 0;
    bool complete_ = false;
    bool terminated_ = false;
};

void AppendRecord(std::string& text, const Record& record) {
    std::array<std::uint8_t, kLengthBytes + 4 + kRecordDataBytes + kChecksumBytes> bytes{};
    const std::size_t addressBytes = TypeOf(record.type).addressBytes;
    const std::size_t size = kLengthBytes + addressBytes + record.data.size();
    bytes[0] = static_cast<std::uint8_t>(addressBytes + record.data.size() + kChecksumBytes);
    for (std::size_t i = 0; i < addressBytes; ++i) {
        bytes[kLengthBytes + i] =
            static_cast<std::uint8_t>(record.address >> 8 * (addressBytes - 1 - i));
    }
    std::ranges::copy(record.data, &bytes[kLengthBytes + addressBytes]);
    bytes[size] = Checksum(Bytes(bytes).first(size));
    text += 'S';
    text += record.type;
    base::AppendHex(text, Bytes(bytes).first(size + kChecksumBytes));
    text += '\n';
}

}  // namespace

Image ParseSRecord(const std::string& contents, const std::string& name) {
    return SRecordReader(contents, name).Read();
}

/// S3 records throughout, between a header and a count as far as a count record can hold it.
std::string FormatSRecord(const Image& image) {
    static constexpr std::array<std::uint8_t, 3> kHeaderText{'H', 'D', 'R'};
    std::string text;
    std::uint32_t count = 0;
    AppendRecord(text, {'0', 0, kHeaderText});
    ForEachRecord(image, [&](std::uint32_t address, Bytes data) {
        AppendRecord(text, {'3', address, data});
        ++count;
    });
    if (count <= 0xFF'FFFF) AppendRecord(text, {count <= 0xFFFF ? '5' : '6', count, {}});
    AppendRecord(text, {'7', 0, {}});
    return text;
}

}  // namespace host::image
