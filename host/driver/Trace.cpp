// Writing trace lines, and being told the plug-in's own.

#include "host/driver/Trace.h"

#include <dlfcn.h>
#include <fmt/format.h>

#include <cerrno>
#include <iterator>
#include <system_error>

#include "host/base/Errors.h"

namespace host {

namespace {

constexpr std::size_t kBufferBytes = std::size_t{64} * 1024;

void ReceiveLine(void* context, int level, const char* text) {
    static_cast<Trace*>(context)->Line("plug-in", fmt::format("{} {}", level, text));
}

}  // namespace

Trace::Trace(const std::string& path)
    : path_(path), stream_(path == "-" ? stderr : std::fopen(path.c_str(), "w")) {
    if (stream_ == nullptr)
        throw Failure(ExitStatus::BadFile,
                      fmt::format("can't write the trace to {}: {}", path,
                                  std::error_code(errno, std::generic_category()).message()));
}

Trace::~Trace() {
    Flush();
    if (stream_ != stderr) std::fclose(stream_);
}

void Trace::Line(const char* source, const std::string& text) {
    const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - start_;
    fmt::format_to(std::back_inserter(pending_), "{:12.6f}  {:<7}  {}\n", elapsed.count(), source,
                   text);
    if (pending_.size() >= kBufferBytes) Flush();
}

void Trace::Flush() {
    std::fwrite(pending_.data(), 1, pending_.size(), stream_);
    std::fflush(stream_);
    pending_.clear();
}

PluginTrace::PluginTrace(Trace& trace, void* library)
    : setSink_(reinterpret_cast<SetSink>(dlsym(library, "OstrelLoggerSetSink"))) {
    if (setSink_ == nullptr)
        trace.Line("host", "the logging library hands out no lines; its own output has them");
    else
        setSink_(ReceiveLine, &trace);
}

PluginTrace::~PluginTrace() {
    if (setSink_ != nullptr) setSink_(nullptr, nullptr);
}

}  // namespace host
