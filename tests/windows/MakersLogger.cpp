// A logger in the maker's place: compiled for Microsoft's ABI it has the names, the calling
// conventions and the table of slots that the maker's own library has.

#include <flash_corvane/ostrel_logger.h>

#include "tests/windows/System.h"

static OstrelLoggerSink theSink;
static void* theContext;

namespace {

class Logger final : public Logging::ILogger {
    void Line(uint64_t instanceId, int facility, int module, int level, const char* format,
              ...) override {
        if (instanceId != 0 || facility != 11 || module != 3) exit(1);
        char text[1000];
        va_list values;
        va_start(values, format);
        vsprintf(text, format, values);
        va_end(values);
        theSink(theContext, level, text);
    }
    void Reserved1() override { exit(1); }
    void Reserved2() override { exit(2); }
    void PlainLine(uint64_t instanceId, int facility, int module, int level,
                   const char* text) override {
        if (instanceId != 0 || facility != 11 || module != 3) exit(1);
        theSink(theContext, level, text);
    }
};
Logger logger;

}  // namespace

bool Logging::LoggerFactory::IsCurrentInstanceEnabled() {
    return theSink != nullptr;
}

Logging::ILogger& Logging::LoggerFactory::Instance() {
    return logger;
}

void OstrelLoggerSetSink(OstrelLoggerSink sink, void* context) {
    theSink = sink;
    theContext = context;
}
