// The names of an option stand in one text, as the help shows them.

#include "host/cli/OptionRow.h"

namespace host {

std::vector<std::string> OptionRow::Names() const {
    const std::string all = names;
    const auto comma = all.find(',');
    if (comma == std::string::npos) return {all};
    return {all.substr(0, comma), all.substr(comma + 1)};
}

}  // namespace host
