#include "logger/LogFile.h"

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstdlib>
#include <cstring>

namespace ostrel {

namespace {

// Appended to, and not handed on to the processes that the host starts.
#if defined(_WIN32)
constexpr auto kAppend = "aN";
#else
constexpr auto kAppend = "ae";
#endif

std::string TimeNow() {
    using namespace std::chrono;
    const auto now = floor<milliseconds>(system_clock::now());
    const year_month_day date(floor<days>(now));
    const hh_mm_ss time(now - floor<days>(now));
    char text[64] = "";
    std::snprintf(
        text, sizeof text, "%04d-%02u-%02uT%02d:%02d:%02d.%03dZ", static_cast<int>(date.year()),
        static_cast<unsigned>(date.month()), static_cast<unsigned>(date.day()),
        static_cast<int>(time.hours().count()), static_cast<int>(time.minutes().count()),
        static_cast<int>(time.seconds().count()), static_cast<int>(time.subseconds().count()));
    return text;
}

}  // namespace

LogFile LogFile::FromEnvironment(const char* variable) {
    LogFile log;
    const char* name = std::getenv(variable);
    if (name == nullptr || *name == '\0') return log;
    if (std::strcmp(name, "-") == 0 || std::strcmp(name, "stderr") == 0) {
        log.file_.reset(stderr);
        return log;
    }
    log.file_.reset(std::fopen(name, kAppend));
    if (!log.IsOpen()) {
        std::fprintf(stderr, "%s: can't write the log file %s: %s\n", variable, name,
                     std::strerror(errno));
    }
    return log;
}

void LogFile::Write(int level, const std::string& text) {
    if (!IsOpen()) return;
    std::string line = TimeNow() + ' ' + std::to_string(level) + ' ' + text;
    std::replace_if(
        line.begin(), line.end(), [](unsigned char c) { return c < 0x20 || c == 0x7F; }, ' ');
    line += '\n';
    std::fwrite(line.data(), 1, line.size(), file_.get());
    std::fflush(file_.get());
}

}  // namespace ostrel
