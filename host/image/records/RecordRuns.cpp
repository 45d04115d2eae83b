// Joining records that continue each other as they come, and the rest after sorting.

#include "host/image/records/RecordRuns.h"

#include <fmt/format.h>

#include <algorithm>
#include <utility>

namespace host::image {

void RecordRuns::Add(std::uint32_t address, Bytes bytes, std::size_t lineNumber) {
    if (bytes.empty()) return;
    const bool continues =
        !runs_.empty() && runs_.back().address + runs_.back().bytes.size() == address;
    if (!continues) runs_.push_back({address, lineNumber, lineNumber, {}});
    Run& run = runs_.back();
    run.bytes.insert(run.bytes.end(), bytes.begin(), bytes.end());
    run.lastLine = lineNumber;
}

Image RecordRuns::Join(const std::string& name) {
    std::ranges::stable_sort(runs_, {}, &Run::address);
    Image image;
    for (Run& run : runs_) {
        const std::string lines = run.firstLine == run.lastLine
                                      ? fmt::format("line {}", run.firstLine)
                                      : fmt::format("lines {} to {}", run.firstLine, run.lastLine);
        image.Add(run.address, std::move(run.bytes), fmt::format("{}: {}", name, lines));
    }
    runs_.clear();
    return image;
}

}  // namespace host::image
