// The one place where the JSON type is compiled.

#include "host/base/Json.h"

template class nlohmann::basic_json<nlohmann::ordered_map>;
