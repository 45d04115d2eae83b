// Asking the terminal, and the environment for what it is.

#include "base/system/Terminal.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <cstdlib>
#include <string_view>

namespace base {

bool IsTerminal(std::FILE* stream) {
    return isatty(fileno(stream)) != 0;
}

bool KnowsEscapes(std::FILE* stream) {
    const char* terminal = std::getenv("TERM");
    return IsTerminal(stream) && terminal != nullptr && std::string_view(terminal) != "dumb";
}

std::size_t TerminalColumns(std::FILE* stream) {
    winsize size{};
    if (ioctl(fileno(stream), TIOCGWINSZ, &size) != 0 || size.ws_col == 0) return 80;
    return size.ws_col;
}

}  // namespace base
