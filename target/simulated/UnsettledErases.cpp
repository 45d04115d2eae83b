// Kept pages, and how long they are kept.

#include "target/simulated/UnsettledErases.h"

namespace target {

namespace {

using namespace std::chrono_literals;

constexpr std::chrono::nanoseconds kSettling = 40ms;

}  // namespace

void UnsettledErases::Erase(std::uint32_t address, std::uint32_t sizeBytes, Time now) {
    ForgetSettled(now);
    entries_.push_back({now + kSettling, flash_.Erase(address, sizeBytes)});
}

bool UnsettledErases::Undo(std::uint32_t address, std::uint32_t sizeBytes, Time now) {
    ForgetSettled(now);
    const std::uint32_t first = address / FlashArray::kPageSizeBytes;
    const std::uint32_t last = (address + sizeBytes - 1) / FlashArray::kPageSizeBytes;
    // A page that was blank before has nothing to come back, on silicon as well.
    bool undone = false;
    for (Entry& entry : entries_) {
        for (auto& [index, page] : entry.pages) {
            if (index < first || index > last || page == nullptr) continue;
            flash_.Preset(static_cast<std::uint32_t>(index) * FlashArray::kPageSizeBytes, *page);
            page.reset();
            undone = true;
        }
    }
    return undone;
}

// Entries are in the order of their ends, and each takes as long to settle.
void UnsettledErases::ForgetSettled(Time now) {
    while (!entries_.empty() && now >= entries_.front().settled)
        entries_.pop_front();
}

}  // namespace target
