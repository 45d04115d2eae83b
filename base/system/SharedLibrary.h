// A shared library that is loaded while the program runs.

#pragma once

#include <memory>
#include <stdexcept>
#include <string>

namespace base {

/// The text says which file, and what is wrong with it.
class LibraryError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// The file name of a library: "libflash_corvane.so" for "flash_corvane".
std::string LibraryFileName(const std::string& name);

class SharedLibrary {
  public:
    SharedLibrary() = default;

    /// Loads a file, which the system looks for in its own places when it is a mere name.
    /// LibraryError, also for a file that the system's loader would hang or die on.
    explicit SharedLibrary(const std::string& file);

    /// nullptr when the library and those that it needs export no such function.
    void* Find(const char* function) const;

    /// The file that a function was loaded from; empty when that isn't known.
    static std::string FileOf(const void* function);

  private:
    struct Unloader {
        void operator()(void* handle) const;
    };
    std::unique_ptr<void, Unloader> handle_;
};

}  // namespace base
