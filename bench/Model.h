// Work on the simulated device, and where its time goes.

#pragma once

#include <chrono>
#include <cstdint>

#include "bench/support/WholeLoads.h"
#include "bench/support/Workloads.h"

namespace bench {

using test::Link;

struct ModelledTime {
    using Seconds = std::chrono::duration<double>;
    Seconds link;
    Seconds pauses;
    Seconds waiting;  ///< for the loader, in the plug-in's own waits
    Seconds loader;   ///< at work

    Seconds Total() const { return link + pauses + waiting; }
};

constexpr Link kFastestLink = {0, 1000, 5};

ModelledTime Model(const test::Workload& work, const Link& link);

}  // namespace bench
