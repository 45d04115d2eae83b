// The stand-in for the maker's logging library. It is off unless the environment variable
// OSTREL_LOG names a file to append to ("-" or "stderr" for standard error), or a host has set a
// sink.

#include "logger/ostrel_logger.h"

#include <atomic>
#include <cstdarg>
#include <mutex>
#include <string>

#include "logger/LogFile.h"

namespace {

// The text that a format and its values make. A format that cannot be carried out stands for
// itself, so that no line is lost.
std::string Formatted(const char* format, std::va_list values) OSTREL_LOGGER_PRINTF(1, 0);
std::string Formatted(const char* format, std::va_list values) {
    std::va_list again;
    va_copy(again, values);
    const int length = std::vsnprintf(nullptr, 0, format, again);
    va_end(again);
    if (length < 0) return format;
    std::string text(static_cast<std::size_t>(length), '\0');
    std::vsnprintf(text.data(), text.size() + 1, format, values);
    return text;
}

class Logger final : public Logging::ILogger {
  public:
    bool Enabled() const { return enabled_.load(std::memory_order_relaxed); }

    void SetSink(OstrelLoggerSink sink, void* context) {
        const std::lock_guard lock(mutex_);
        sink_ = sink;
        context_ = context;
        enabled_ = sink_ != nullptr || file_.IsOpen();
    }

    [[gnu::format(printf, 6, 7)]] void Line(std::uint64_t, int, int, int level, const char* format,
                                            ...) override {
        std::va_list values;
        va_start(values, format);
        const std::string text = Formatted(format, values);
        va_end(values);
        Write(level, text);
    }

    void Reserved1() override {}
    void Reserved2() override {}

    void PlainLine(std::uint64_t, int, int, int level, const char* text) override {
        Write(level, text);
    }

  private:
    // The sink is called without the lock: it may log, or set another sink.
    void Write(int level, const std::string& text) {
        std::unique_lock lock(mutex_);
        const OstrelLoggerSink sink = sink_;
        void* const context = context_;
        if (sink == nullptr) return file_.Write(level, text);
        lock.unlock();
        sink(context, level, text.c_str());
    }

    std::mutex mutex_;
    ostrel::LogFile file_ = ostrel::LogFile::FromEnvironment("OSTREL_LOG");
    OstrelLoggerSink sink_ = nullptr;
    void* context_ = nullptr;
    std::atomic<bool> enabled_ = file_.IsOpen();
};

// Made by the first line, not when the library is loaded.
Logger& TheLogger() {
    static Logger logger;
    return logger;
}

}  // namespace

bool Logging::LoggerFactory::IsCurrentInstanceEnabled() {
    return TheLogger().Enabled();
}

Logging::ILogger& Logging::LoggerFactory::Instance() {
    return TheLogger();
}

void OstrelLoggerSetSink(OstrelLoggerSink sink, void* context) {
    TheLogger().SetSink(sink, context);
}
