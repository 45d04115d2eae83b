// The bytes that the records of a text file give, collected in the order of the file and made into
// an image in the order of addresses, so that the work stays small for a file in any order.

#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "host/image/Image.h"

namespace host::image {

class RecordRuns {
  public:
    /// Adds a record's bytes, which may be none, and the line that they stand in.
    void Add(std::uint32_t address, Bytes bytes, std::size_t lineNumber);

    /// The image of all of them, which are gone then; `name` is the file's for error texts.
    Image Join(const std::string& name);

  private:
    /// Records that continue each other.
    struct Run {
        std::uint32_t address;
        std::size_t firstLine;
        std::size_t lastLine;
        std::vector<std::uint8_t> bytes;
    };

    std::vector<Run> runs_;
};

}  // namespace host::image
