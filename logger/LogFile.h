// Where the lines of the stand-in logger go: a file, standard error, or nowhere.

#pragma once

#include <cstdio>
#include <memory>
#include <string>

namespace ostrel {

class LogFile {
  public:
    /// Opens what the environment variable of that name asks for; not open when it is not set, or
    /// when the file cannot be written, which is then said once on standard error.
    static LogFile FromEnvironment(const char* variable);

    bool IsOpen() const { return file_ != nullptr; }

    /// Writes one line: the time in UTC, the level and the text, with control characters in the
    /// text shown as spaces. Each line is handed to the system at once, so that a crash of the
    /// process loses none. Does nothing when not open.
    void Write(int level, const std::string& text);

  private:
    struct Closer {
        void operator()(std::FILE* file) const {
            if (file != stderr) std::fclose(file);
        }
    };

    std::unique_ptr<std::FILE, Closer> file_;
};

}  // namespace ostrel
