// The topics that the help explains beside the commands.

#pragma once

#include <span>
#include <string>

namespace host {

struct Topic {
    const char* name;
    const char* help;
    std::string (*text)();
};

std::span<const Topic> Topics();

}  // namespace host
