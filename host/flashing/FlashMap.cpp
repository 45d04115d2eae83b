// From contents and plan to runs, from runs to characters.

#include "host/flashing/FlashMap.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <utility>

#include "base/AddressSet.h"
#include "base/Hex.h"

namespace host {

namespace {

constexpr struct {
    char mark;
    const char* name;  ///< in JSON
    const char* meaning;
} kStates[] = {
    {'.', "blank", "blank"},
    {'#', "used", "in use"},
    {'=', "held", "held already"},
    {'+', "program", "to be programmed"},
    {'x', "cleared", "cleared along with it"},
    {'!', "blocked", "needs an erase first"},
};

constexpr std::uint64_t kLinesMax = 16;

const auto& RowOf(MapState state) {
    return kStates[static_cast<std::size_t>(state)];
}

class Mapper {
  public:
    Mapper(const std::vector<std::uint8_t>& contents, const image::Image& image,
           const LoadPlan& plan)
        : contents_(contents), image_(image) {
        for (const base::AddressRange& run : plan.erased)
            erased_.Add(run);
        for (const image::Section& section : plan.sections)
            programmed_.Add({section.address, section.Last()});
    }

    /// Goes on with a sector, in pieces that the image covers or leaves out.
    void AddSector(std::uint32_t first, std::uint32_t last) {
        const auto& sections = image_.Sections();
        for (std::uint64_t next = first; next <= last;) {
            while (section_ < sections.size() && sections[section_].End() <= next)
                ++section_;
            const bool ends = section_ == sections.size() || sections[section_].address > last;
            const bool covered = !ends && sections[section_].address <= next;
            const std::uint64_t end = covered ? sections[section_].End()
                                      : ends  ? std::uint64_t{last} + 1
                                              : sections[section_].address;
            const base::AddressRange piece{
                static_cast<std::uint32_t>(next),
                static_cast<std::uint32_t>(std::min<std::uint64_t>(end - 1, last))};
            Append(piece, StateOf(piece, covered));
            next = std::uint64_t{piece.last} + 1;
        }
    }

    std::vector<MapRun> Runs() { return std::move(runs_); }

  private:
    MapState StateOf(const base::AddressRange& piece, bool covered) const {
        const base::AddressRange start{piece.first, piece.first};
        if (covered && programmed_.BytesIn(start) == 0) return MapState::Held;
        if (covered) return IsBlocked(piece) ? MapState::Blocked : MapState::Program;
        const auto begin = contents_.begin() + static_cast<std::ptrdiff_t>(piece.first);
        const bool blank = std::all_of(begin, begin + static_cast<std::ptrdiff_t>(piece.Size()),
                                       [](std::uint8_t byte) { return byte == 0xFF; });
        if (blank) return MapState::Blank;
        return erased_.BytesIn(start) != 0 ? MapState::Cleared : MapState::Used;
    }

    /// Programming can only clear bits.
    bool IsBlocked(const base::AddressRange& piece) const {
        if (erased_.BytesIn({piece.first, piece.first}) != 0) return false;
        const image::Section& section = image_.Sections()[section_];
        for (std::uint64_t at = piece.first; at <= piece.last; ++at)
            if ((section.bytes[at - section.address] & ~contents_[at]) != 0) return true;
        return false;
    }

    void Append(const base::AddressRange& piece, MapState state) {
        if (!runs_.empty() && runs_.back().state == state)
            runs_.back().range.last = piece.last;
        else
            runs_.push_back({piece, state});
    }

    const std::vector<std::uint8_t>& contents_;
    const image::Image& image_;
    base::AddressSet erased_;
    base::AddressSet programmed_;
    std::size_t section_ = 0;
    std::vector<MapRun> runs_;
};

/// As many characters as fit, in a number that keeps the addresses of the lines round.
std::uint64_t CellsPerLine(std::size_t columns) {
    const std::uint64_t unit = columns >= 16 ? 16 : 8;
    return std::max<std::uint64_t>(columns / unit * unit, 8);
}

std::uint64_t RoundUp(std::uint64_t amount, std::uint64_t unit) {
    return (amount + unit - 1) / unit;
}

/// One character for each cell: of the states of all runs in it, the one that matters most.
std::string Cells(const std::vector<MapRun>& runs, std::uint64_t flashBytes,
                  std::uint64_t cellBytes) {
    std::vector<MapState> states(RoundUp(flashBytes, cellBytes), MapState::Blank);
    for (const MapRun& run : runs)
        for (std::uint64_t cell = run.range.first / cellBytes; cell <= run.range.last / cellBytes;
             ++cell)
            states[cell] = std::max(states[cell], run.state);
    std::string cells;
    for (const MapState state : states)
        cells += RowOf(state).mark;
    return cells;
}

std::vector<std::string> Legend(const std::vector<MapRun>& runs) {
    std::array<std::uint64_t, std::size(kStates)> bytes{};
    for (const MapRun& run : runs)
        bytes[static_cast<std::size_t>(run.state)] += run.range.Size();
    std::vector<std::string> lines;
    for (std::size_t i = 0; i < bytes.size(); ++i)
        if (bytes[i] != 0)
            lines.push_back(fmt::format("  {} {:<22} {}", kStates[i].mark, kStates[i].meaning,
                                        SizeText(bytes[i])));
    return lines;
}

}  // namespace

std::vector<MapRun> MapFlash(const std::vector<std::uint8_t>& contents, const FlashGeometry& flash,
                             const image::Image& image, const LoadPlan& plan) {
    Mapper mapper(contents, image, plan);
    for (std::uint64_t first = 0; first < contents.size(); first += flash.sectorBytes)
        mapper.AddSector(
            static_cast<std::uint32_t>(first),
            static_cast<std::uint32_t>(
                std::min<std::uint64_t>(first + flash.sectorBytes, contents.size()) - 1));
    return mapper.Runs();
}

std::vector<std::string> DrawMap(const std::vector<MapRun>& runs, const FlashGeometry& flash,
                                 std::size_t columns) {
    const std::size_t label =
        base::HexText(static_cast<std::uint32_t>(flash.flashBytes - 1)).size();
    const std::uint64_t perLine = CellsPerLine(columns > label + 3 ? columns - label - 3 : 8);
    std::uint64_t sectors = 1;
    while (RoundUp(flash.flashBytes, sectors * flash.sectorBytes) > perLine * kLinesMax)
        sectors *= 2;
    const std::uint64_t cellBytes = sectors * flash.sectorBytes;
    const std::string cells = Cells(runs, flash.flashBytes, cellBytes);
    std::vector<std::string> lines;
    for (std::uint64_t first = 0; first < cells.size(); first += perLine)
        lines.push_back(
            fmt::format("{:#0{}x}  {}", first * cellBytes, label, cells.substr(first, perLine)));
    lines.push_back(
        sectors == 1 ? "A character is a sector of " + SizeText(cellBytes)
                     : fmt::format("A character is {} sectors, {}", sectors, SizeText(cellBytes)));
    for (std::string& line : Legend(runs))
        lines.push_back(std::move(line));
    return lines;
}

Json ToJson(const std::vector<MapRun>& runs) {
    Json all = Json::array();
    for (const MapRun& run : runs)
        all.push_back({{"address", run.range.first},
                       {"bytes", run.range.Size()},
                       {"state", RowOf(run.state).name}});
    return all;
}

std::vector<std::uint8_t> ReadAll(FlashReader& reader, WorkMeter& meter,
                                  const FlashGeometry& flash) {
    reader.Halt();
    meter.Expect(Phase::Read, flash.flashBytes);
    meter.Begin(Phase::Read);
    auto contents = reader.ReadFlash({0, static_cast<std::uint32_t>(flash.flashBytes - 1)});
    meter.End();
    return contents;
}

Json ShowMap(Reporter& reporter, const std::vector<std::uint8_t>& contents,
             const FlashGeometry& flash, const image::Image& image, const LoadPlan& plan) {
    const std::vector<MapRun> runs = MapFlash(contents, flash, image, plan);
    for (const std::string& line : DrawMap(runs, flash, reporter.Columns()))
        reporter.Result(line);
    return ToJson(runs);
}

}  // namespace host
