// The trace interface of ostrel_logger, the maker's logging library.
//
// The plug-in is linked against the shared library alone, so the maker's own library can take the
// place of the stand-in that is built here without a rebuild. The names and the slots of ILogger
// are therefore a binary contract.

#ifndef OSTREL_LOGGER_H
#define OSTREL_LOGGER_H

#include <stdint.h>

// Windows exports what the library's list names, and knows no visibility.
#if defined(__GNUC__) && !defined(_WIN32)
#define OSTREL_LOGGER_API __attribute__((visibility("default")))
#else
#define OSTREL_LOGGER_API
#endif

#if defined(__GNUC__)
#define OSTREL_LOGGER_PRINTF(text, first) __attribute__((format(printf, text, first)))
#else
#define OSTREL_LOGGER_PRINTF(text, first)
#endif

namespace Logging {

class ILogger {
  public:
    // Slot 0. Writes one line, formatted as printf does. instanceId tells the lines of several
    // sources apart; the two numbers behind it are fixed by the caller and mean nothing here.
    // Levels: 1 information, 2 entry into an operation, 3 its result.
    // [logger implements; any time while IsCurrentInstanceEnabled is true]
    virtual void Line(uint64_t instanceId, int, int, int level, const char* format, ...)
        OSTREL_LOGGER_PRINTF(6, 7) = 0;

    // Slot 1. Keeps its place; takes nothing and does nothing.
    // [reserved; never called]
    virtual void Reserved1() = 0;

    // Slot 2. Keeps its place; takes nothing and does nothing.
    // [reserved; never called]
    virtual void Reserved2() = 0;

    // Slot 3. Writes one line of finished text; percent signs in it mean nothing.
    // [logger implements; any time while IsCurrentInstanceEnabled is true]
    virtual void PlainLine(uint64_t instanceId, int, int, int level, const char* text) = 0;

  protected:
    ~ILogger() = default;
};

class LoggerFactory {
  public:
    // Whether anybody wants the lines. Asked before each one.
    OSTREL_LOGGER_API static bool IsCurrentInstanceEnabled();

    // The logger of the process. Fetched anew for each line.
    OSTREL_LOGGER_API static ILogger& Instance();
};

}  // namespace Logging

extern "C" {

// Additions of the stand-in; the maker's library does not have them, so a host looks them up at
// run time and does without them where they are missing.

// Receives one finished line: its level, and its text, valid during the call. The text has no line
// break of its own; texts of the host in it, such as the variant, may have some.
typedef void (*OstrelLoggerSink)(void* context, int level, const char* text);

// Hands every line from now on to sink, together with context, instead of writing it. A null sink
// ends that and switches back to what the environment asked for.
// A sink is called on the thread that logs, and by several threads at once when several log. It may
// itself log, which calls it again, and may set another sink or none. A line that another thread is
// logging while the sink is replaced may still reach the old one: keep that and its context alive
// until no such line is under way.
OSTREL_LOGGER_API void OstrelLoggerSetSink(OstrelLoggerSink sink, void* context);
}

#endif
