// Writing trace lines, and being told the plug-in's own.

#include "host/driver/Trace.h"

#include <fmt/format.h>

#include <cerrno>

#include "base/system/ErrorText.h"
#include "base/system/Files.h"
#include "base/system/StandardStreams.h"
#include "host/base/Printable.h"
#include "host/files/InputFile.h"
#include "host/files/Streams.h"

namespace host {

namespace {

constexpr FileKind kTraceFile{"trace", ExitStatus::BadFile, 0};

/// By this beginning of its first line a file is known to be a trace.
constexpr char kFirstLine[] = "# Trace of corvane-flash";

void ReceiveLine(void* context, int level, const char* text) {
    static_cast<Trace*>(context)->Line("plug-in", fmt::format("{} {}", level, text));
}

bool IsTrace(const std::string& path) {
    const auto status = base::StatusOf(path);
    return status && status->type == base::FileType::Regular &&
           InputFile(kTraceFile, path).Beginning().starts_with(kFirstLine);
}

base::Descriptor Open(const std::string& path, Existing existing) {
    if (path == "-") return base::Duplicate(base::kStandardError);
    RequireWritable(kTraceFile, path, IsTrace(path) ? Existing::Replace : existing);
    base::Descriptor file = OpenForWriting(kTraceFile, path);
    const auto status = base::StatusOf(file.Get());
    if (!status || status->type != base::FileType::Regular) return file;
    if (base::TryLock(file.Get()) == base::LockState::Busy)
        throw FileFailure(kTraceFile, "write", path, "another run is writing it");
    if (!base::MakeEmpty(file.Get())) throw FileFailure(kTraceFile, "write", path, errno);
    return file;
}

}  // namespace

Trace::Trace(const std::string& path, Existing existing)
    : path_(path), file_(Open(path, existing)) {
    Write(fmt::format("{} {}: seconds, source, event\n", kFirstLine, CORVANE_FLASH_VERSION));
}

void Trace::Line(const char* source, const std::string& text) {
    const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - start_;
    Write(fmt::format("{:12.6f}  {:<7}  {}\n", elapsed.count(), source, Printable(text)));
}

void Trace::Write(const std::string& text) {
    if (error_ == 0) error_ = WriteAll(file_.Get(), text);
}

std::string Trace::Problem() const {
    if (error_ == 0) return {};
    return fmt::format("the trace {} is incomplete: {}", path_ == "-" ? "on standard error" : path_,
                       base::ErrorText(error_));
}

PluginTrace::PluginTrace(Trace& trace, const base::SharedLibrary& library)
    : setSink_(reinterpret_cast<SetSink>(library.Find("OstrelLoggerSetSink"))) {
    if (setSink_ == nullptr)
        trace.Line("host", "the logging library hands out no lines; its own output has them");
    else
        setSink_(ReceiveLine, &trace);
}

PluginTrace::~PluginTrace() {
    if (setSink_ != nullptr) setSink_(nullptr, nullptr);
}

}  // namespace host
