// Reading ranges of RAM and writing them back.

#include "host/checks/SavedMemory.h"

#include <fmt/format.h>

#include <utility>

#include "host/base/Text.h"
#include "host/facts/FlashMemory.h"

namespace host {

namespace {

std::vector<std::uint8_t> ReadRange(target::Target& target, const base::AddressRange& range) {
    std::vector<std::uint8_t> bytes(range.Size());
    target.Read(bytes.data(), bytes.size(), range.first, plugin::kRamPage, 1);
    return bytes;
}

}  // namespace

SavedMemory::SavedMemory(target::Target& target, base::AddressSet ranges)
    : target_(target), ranges_(std::move(ranges)) {
    for (const base::AddressRange& range : ranges_.Ranges())
        contents_.push_back(ReadRange(target_, range));
}

void SavedMemory::PutBack() const {
    for (std::size_t i = 0; i < contents_.size(); ++i) {
        const base::AddressRange& range = ranges_.Ranges()[i];
        target_.Write(contents_[i].data(), contents_[i].size(), range.first, plugin::kRamPage, 1);
        if (ReadRange(target_, range) != contents_[i])
            throw target::TargetError(fmt::format(
                "the RAM at {} doesn't hold what was put back there", RangeText(range)));
    }
}

}  // namespace host
