// Reading files that may be anything: regular files, pipes, devices, standard input. None is read
// beyond what one of its kind can hold, and Ctrl-C ends the wait for any.

#pragma once

#include <cstdint>
#include <string>

#include "base/system/Descriptor.h"
#include "host/files/FileKind.h"

namespace host {

class InputFile {
  public:
    /// Opens the file; "-" is standard input for kinds that come from there. Failure (of the kind's
    /// status) as in all below.
    InputFile(const FileKind& kind, const std::string& path);

    /// The first 64 KiB; less only of a smaller file.
    const std::string& Beginning();

    /// All of it. A regular file of more than `maxBytes` is refused before it is read, anything
    /// else when it has given that much.
    std::string Contents(std::uint64_t maxBytes);

  private:
    void ReadUntil(std::uint64_t bytes);
    [[noreturn]] void FailTooLarge(std::uint64_t maxBytes) const;

    const FileKind& kind_;
    const std::string path_;
    base::Descriptor file_;
    std::string contents_;
    bool ended_ = false;
};

/// All of a file, within the bound of its kind.
std::string ReadWholeFile(const FileKind& kind, const std::string& path);

}  // namespace host
