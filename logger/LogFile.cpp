#include "logger/LogFile.h"

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <ctime>

namespace ostrel {

namespace {

std::string TimeNow() {
    using std::chrono::milliseconds;
    const auto sinceEpoch = std::chrono::duration_cast<milliseconds>(
        std::chrono::system_clock::now().time_since_epoch());
    const auto seconds = static_cast<std::time_t>(sinceEpoch.count() / 1000);
    std::tm utc{};
    gmtime_r(&seconds, &utc);
    char date[32] = "";
    std::strftime(date, sizeof date, "%Y-%m-%dT%H:%M:%S", &utc);
    char text[48] = "";
    std::snprintf(text, sizeof text, "%s.%03dZ", date, static_cast<int>(sinceEpoch.count() % 1000));
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
    log.file_.reset(std::fopen(name, "ae"));
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
