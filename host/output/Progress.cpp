// Drawing a bar or plain lines on standard error.

#include "host/output/Progress.h"

#include <fmt/format.h>

#include <algorithm>
#include <string_view>
#include <vector>

#include "base/system/Terminal.h"
#include "host/base/Text.h"

namespace host {

namespace {

using namespace std::chrono_literals;

constexpr auto kUpdateInterval = 100ms;
constexpr std::size_t kLabelColumns = 12;
constexpr std::size_t kPercentColumns = 7;
constexpr std::size_t kDetailColumns = 50;  ///< what amounts, time left and rate can take
constexpr std::size_t kBarColumnsMin = 8;
constexpr std::size_t kBarColumnsMax = 40;

std::string RateText(const PhaseProgress& progress) {
    if (progress.doneBytes == 0) return "";
    const double rate = static_cast<double>(progress.doneBytes) / std::max(progress.seconds, 1e-3);
    return SizeText(static_cast<std::uint64_t>(rate)) + "/s";
}

std::string TimeLeftText(const PhaseProgress& progress) {
    if (progress.doneBytes == 0) return "";
    const double left = progress.seconds *
                        static_cast<double>(progress.totalBytes - progress.doneBytes) /
                        static_cast<double>(progress.doneBytes);
    return DurationText(left) + " left";
}

std::string Bar(unsigned percent, std::size_t columns) {
    const std::size_t full = columns * percent / 100;
    return fmt::format("[{:#<{}}{:.<{}}]", "", full, "", columns - full);
}

}  // namespace

ProgressStyle ChooseStyle(const std::string& option, std::FILE* stream) {
    if (option == "bar") return ProgressStyle::Bar;
    if (option == "plain") return ProgressStyle::Plain;
    if (option == "none" || !base::IsTerminal(stream)) return ProgressStyle::None;
    return base::KnowsEscapes(stream) ? ProgressStyle::Bar : ProgressStyle::Plain;
}

std::string BarLine(Phase phase, const PhaseProgress& progress, std::size_t columns) {
    std::string line =
        fmt::format("{:<{}} {:>3} %", Name(phase).running, kLabelColumns, progress.Percent());
    std::string details;
    for (const std::string& detail :
         {SizeText(progress.doneBytes) + " of " + SizeText(progress.totalBytes),
          TimeLeftText(progress), RateText(progress)}) {
        if (detail.empty()) continue;
        if (line.size() + details.size() + 2 + detail.size() > columns) break;
        details += "  " + detail;
    }
    // The bar's width depends on the terminal's alone, so that it doesn't jump about.
    constexpr std::size_t others = kLabelColumns + kPercentColumns + kDetailColumns;
    if (columns >= others + kBarColumnsMin)
        line.insert(kLabelColumns,
                    fmt::format(" {}", Bar(progress.Percent(),
                                           std::min(columns - others, kBarColumnsMax))));
    return (line + details).substr(0, columns);
}

bool UpdateGate::Passes(Phase phase, const PhaseProgress& progress, Time now) {
    const auto found = last_.find(phase);
    if (found != last_.end()) {
        const Last& last = found->second;
        const bool complete = progress.doneBytes == progress.totalBytes;
        const bool early = now - last.time < kUpdateInterval && !complete;
        if (early || progress.doneBytes <= last.progress.doneBytes) return false;
    }
    last_[phase] = {now, progress};
    return true;
}

std::string Erasure(std::size_t drawnColumns, std::size_t columns) {
    const std::size_t above = drawnColumns == 0 ? 0 : (drawnColumns - 1) / columns;
    return above == 0 ? "\r\033[K" : fmt::format("\033[{}A\r\033[J", above);
}

void ProgressDisplay::DrawBar(Phase phase, const PhaseProgress& progress) {
    if (style_ != ProgressStyle::Bar) return;
    // One column stays free: a terminal wraps when its last one is written.
    const std::size_t columns = base::TerminalColumns(stream_);
    const std::string line = BarLine(phase, progress, columns - 1);
    write_(Erasure(drawnColumns_, columns) + line);
    drawnColumns_ = line.size();
}

void ProgressDisplay::DrawPlain(Phase phase, const PhaseProgress& progress) {
    unsigned& next = nextPercent_[phase];
    if (style_ != ProgressStyle::Plain || progress.Percent() < next) return;
    write_(fmt::format("{}: {} % ({} of {})\n", Name(phase).running, progress.Percent(),
                       SizeText(progress.doneBytes), SizeText(progress.totalBytes)));
    next = progress.Percent() / 10 * 10 + 10;
}

void ProgressDisplay::Clear() {
    if (drawnColumns_ == 0) return;
    write_(Erasure(drawnColumns_, base::TerminalColumns(stream_)));
    drawnColumns_ = 0;
}

}  // namespace host
