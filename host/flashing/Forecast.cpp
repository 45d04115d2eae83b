// The load is carried out on a copy of the contents: an erase sets bits, programming clears them.

#include "host/flashing/Forecast.h"

#include <fmt/format.h>

#include <algorithm>

namespace host {

namespace {

/// The plug-in checks whole words.
constexpr std::uint32_t kBlankCheckUnit = 4;

std::optional<NotBlank> FirstNotBlank(const std::vector<std::uint8_t>& flash,
                                      const image::Section& section) {
    const base::AddressRange range = Widened({section.address, section.Last()}, kBlankCheckUnit);
    const auto end = std::min<std::uint64_t>(std::uint64_t{range.last} + 1, flash.size());
    for (std::uint64_t at = range.first; at < end; ++at)
        if (flash[at] != 0xFF) return NotBlank{static_cast<std::uint32_t>(at), flash[at]};
    return std::nullopt;
}

}  // namespace

Forecast ForecastLoad(const LoadPlan& plan, const image::Image& image,
                      std::vector<std::uint8_t> contents) {
    for (const base::AddressRange& run : plan.erased)
        std::fill(contents.begin() + run.first, contents.begin() + run.last + 1, 0xFF);
    Forecast forecast;
    for (const image::Section& section : plan.sections) {
        if (plan.checks.blankCheck) forecast.notBlank = FirstNotBlank(contents, section);
        if (forecast.notBlank) return forecast;
        for (std::size_t i = 0; i < section.bytes.size(); ++i)
            contents[section.address + i] &= section.bytes[i];
    }
    if (!plan.checks.compare) return forecast;
    for (const image::Section& section : image.Sections())
        Compare(forecast.differences, section.address, section.bytes,
                std::span(contents).subspan(section.address, section.bytes.size()));
    return forecast;
}

void FailAsNotBlank(Outcome& outcome, const NotBlank& found) {
    outcome.status = ExitStatus::ContentsDiffer;
    outcome.error =
        fmt::format("this load would fail: the flash isn't blank: {:#x} holds {:#04x}, not 0xff",
                    found.address, found.actual);
    outcome.result.update({{"blank", false}, {"address", found.address}, {"actual", found.actual}});
}

}  // namespace host
