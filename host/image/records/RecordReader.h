// What reading Intel HEX and reading S-records have in common: a text file with one record a line,
// whose bytes stand as pairs of hexadecimal digits.

#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "host/image/Image.h"

namespace host::image {

/// The sum of the bytes modulo 256, from which both formats make their checksum.
std::uint8_t ByteSum(Bytes bytes);

/// Goes through a file line by line. Both references must outlive the reader.
class RecordReader {
  public:
    RecordReader(const std::string& contents, const std::string& name)
        : rest_(contents), name_(name) {}

    /// Goes to the next line that isn't blank; false at the end of the file. A line ends with LF
    /// or CRLF, the last one with the file; blanks around a record don't count.
    bool NextLine();

    std::string_view Line() const { return line_; }
    std::size_t LineNumber() const { return lineNumber_; }

    /// The bytes whose digits begin at that column (from 0) and fill the line; valid until the
    /// next call. No more than the longest record of both formats has.
    Bytes DecodeFrom(std::size_t column);

    /// Fails unless there are as many bytes as the record's own length byte announces.
    void RequireSize(std::size_t found, std::size_t expected) const;

    /// Fails unless the checksum is right.
    void RequireChecksum(std::uint8_t found, std::uint8_t expected) const;

    /// Throws a Failure (BadFile) that names the file and the line.
    [[noreturn]] void FailHere(const std::string& text) const;

    /// Throws a Failure (BadFile) that names the file.
    [[noreturn]] void Fail(const std::string& text) const;

  private:
    [[noreturn]] void FailDamaged(const std::string& text) const;
    [[noreturn]] void FailAtDigit(std::size_t column) const;

    std::string_view rest_;
    std::string_view line_;
    std::size_t lineNumber_ = 0;
    const std::string& name_;
    std::array<std::uint8_t, 260> bytes_{};
};

}  // namespace host::image
