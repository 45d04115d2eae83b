// The trace file: what host and plug-in did, line by line with times, for the person whose board
// doesn't erase. Lines are buffered, so that tracing changes the timing little.

#pragma once

#include <chrono>
#include <cstdio>
#include <memory>
#include <string>

namespace host {

class Trace {
  public:
    /// Opens the file; "-" is standard error. Failure (BadFile).
    explicit Trace(const std::string& path);
    ~Trace();

    Trace(const Trace&) = delete;
    Trace& operator=(const Trace&) = delete;

    /// `source` is who speaks: "host" for a slot that the plug-in calls, "call" for a call into the
    /// plug-in, "plug-in" for one of its own trace lines.
    void Line(const char* source, const std::string& text);

    void Flush();

  private:
    std::string path_;
    std::FILE* stream_;
    std::string pending_;
    std::chrono::steady_clock::time_point start_ = std::chrono::steady_clock::now();
};

/// Sends the plug-in's trace lines to a trace for as long as it lives. The maker's logging library
/// can't do that; then the trace says so and has the host's lines only. `library` is the handle of
/// the loaded plug-in.
class PluginTrace {
  public:
    PluginTrace(Trace& trace, void* library);
    ~PluginTrace();

    PluginTrace(const PluginTrace&) = delete;
    PluginTrace& operator=(const PluginTrace&) = delete;

  private:
    using SetSink = void (*)(void (*)(void*, int, const char*), void*);
    SetSink setSink_;
};

}  // namespace host
