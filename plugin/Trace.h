// Trace lines to the maker's logging library.

#pragma once

#include "logger/ostrel_logger.h"

enum class TraceLevel : int {
    Information = 1,
    Entry = 2,
    Result = 3,
};

// The numbers that every line of this library carries before its level.
inline constexpr int kTraceFacility = 11;
inline constexpr int kTraceModule = 3;

// Writes a line for the device object whose member function it stands in. A macro, so that the
// values are not even computed when nobody is listening, and the compiler checks each format.
#define TRACE(level, ...)                                                                        \
    do {                                                                                         \
        if (Logging::LoggerFactory::IsCurrentInstanceEnabled()) {                                \
            Logging::LoggerFactory::Instance().Line(p_mInstanceId, kTraceFacility, kTraceModule, \
                                                    static_cast<int>(TraceLevel::level),         \
                                                    __VA_ARGS__);                                \
        }                                                                                        \
    } while (false)

// The same for a finished text, whatever percent signs it has.
#define TRACE_TEXT(level, text)                                                                   \
    do {                                                                                          \
        if (Logging::LoggerFactory::IsCurrentInstanceEnabled()) {                                 \
            Logging::LoggerFactory::Instance().PlainLine(                                         \
                p_mInstanceId, kTraceFacility, kTraceModule, static_cast<int>(TraceLevel::level), \
                (text).c_str());                                                                  \
        }                                                                                         \
    } while (false)
