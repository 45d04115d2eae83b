// How a load would end, by what the flash holds before it: what a dry run promises.

#pragma once

#include <cstdint>
#include <optional>
#include <vector>

#include "host/driver/FlashWatch.h"
#include "host/flashing/Comparison.h"
#include "host/flashing/LoadPlan.h"
#include "host/image/Image.h"
#include "host/output/Reporter.h"

namespace host {

struct Forecast {
    std::optional<NotBlank> notBlank =
        {};                        ///< what the blank check would find, which ends the load
    Differences differences = {};  ///< what the comparison would find
};

/// `contents` is all of the flash, `image` what the plan was made for. Cells that are worn out or
/// protected can't be known.
Forecast ForecastLoad(const LoadPlan& plan, const image::Image& image,
                      std::vector<std::uint8_t> contents);

/// Makes the outcome of a dry run the failure (ContentsDiffer) of a blank check to come.
void FailAsNotBlank(Outcome& outcome, const NotBlank& found);

}  // namespace host
