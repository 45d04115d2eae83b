// Makes the compiler lay out the interfaces' tables of slots; see slots.sh.

#include "logger/ostrel_logger.h"
#include "plugin/IFlashDevice2.h"
#include "plugin/IFlashHost.h"

template <typename Interface>
struct Implementation : Interface {
    Implementation();
};
template <typename Interface>
Implementation<Interface>::Implementation() = default;

template struct Implementation<IFlashHost>;
template struct Implementation<IFlashDevice2>;
template struct Implementation<Logging::ILogger>;
