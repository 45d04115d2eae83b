// Stands before the logger and marks every line that comes with other numbers than the plug-in's,
// or through the wrong slot: the plain one takes the text of a sector erase and no other. A marked
// line differs from its transcript.

#include <dlfcn.h>

#include <cstdarg>
#include <cstdio>
#include <string>

#include "logger/ostrel_logger.h"

namespace {

Logging::ILogger& RealLogger() {
    static const auto instance = reinterpret_cast<Logging::ILogger& (*)()>(
        dlsym(RTLD_NEXT, "_ZN7Logging13LoggerFactory8InstanceEv"));
    return instance();
}

class NumberChecker final : public Logging::ILogger {
  public:
    [[gnu::format(printf, 6, 7)]] void Line(uint64_t id, int facility, int module, int level,
                                            const char* format, ...) override {
        char text[4096];
        std::va_list values;
        va_start(values, format);
        std::vsnprintf(text, sizeof text, format, values);
        va_end(values);
        Pass(id, facility, module, level, text, false);
    }
    void Reserved1() override {}
    void Reserved2() override {}
    void PlainLine(uint64_t id, int facility, int module, int level, const char* text) override {
        Pass(id, facility, module, level, text, true);
    }

  private:
    static void Pass(uint64_t id, int facility, int module, int level, const std::string& text,
                     bool plain) {
        const bool right = id == 0 && facility == 11 && module == 3 &&
                           plain == text.starts_with("Erasing Flash Page");
        RealLogger().PlainLine(id, facility, module, level,
                               ((right ? "" : "WRONG ") + text).c_str());
    }
};

}  // namespace

__attribute__((visibility("default"))) Logging::ILogger& Logging::LoggerFactory::Instance() {
    static NumberChecker checker;
    return checker;
}
