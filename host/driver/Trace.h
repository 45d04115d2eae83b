// The trace file: what host and plug-in did, line by line with times, for the person whose board
// doesn't erase. Every line is written at once, so that those before a crash are there.

#pragma once

#include <chrono>
#include <string>

#include "base/system/Descriptor.h"
#include "base/system/SharedLibrary.h"
#include "host/files/OutputFile.h"

namespace host {

class Trace {
  public:
    /// Opens the file; "-" is standard error. A file that is there is written over only when it
    /// may be replaced, or is a trace itself; else Failure (WrongUsage). Failure (BadFile) for one
    /// that can't be written, or that another run is writing.
    Trace(const std::string& path, Existing existing);

    /// `source` is who speaks: "host" for a slot that the plug-in calls, "call" for a call into the
    /// plug-in, "plug-in" for one of its own trace lines. What can't be written is remembered.
    void Line(const char* source, const std::string& text);

    /// Why the trace isn't whole, for the user; empty when it is.
    std::string Problem() const;

  private:
    void Write(const std::string& text);

    std::string path_;
    base::Descriptor file_;
    int error_ = 0;
    std::chrono::steady_clock::time_point start_ = std::chrono::steady_clock::now();
};

/// Sends the plug-in's trace lines to a trace for as long as it lives. The maker's logging library
/// can't do that; then the trace says so and has the host's lines only. `library` is the loaded
/// plug-in.
class PluginTrace {
  public:
    PluginTrace(Trace& trace, const base::SharedLibrary& library);
    ~PluginTrace();

    PluginTrace(const PluginTrace&) = delete;
    PluginTrace& operator=(const PluginTrace&) = delete;

  private:
    using SetSink = void (*)(void (*)(void*, int, const char*), void*);
    SetSink setSink_;
};

}  // namespace host
