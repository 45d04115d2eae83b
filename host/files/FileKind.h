// What a file is to the tool: its name in error texts, the exit status when it can't be used, and
// how large one of its kind can be.

#pragma once

#include <cstdint>
#include <string>

#include "host/base/Errors.h"

namespace host {

struct FileKind {
    const char* name;  ///< "image file"
    ExitStatus unusable;
    std::uint64_t maxBytes;
    bool fromStandardInput = false;  ///< "-" is standard input, and not a file of that name
};

/// The Failure of an error number: "can't read the image file none.hex: No such file or directory".
Failure FileFailure(const FileKind& kind, const char* doing, const std::string& path, int error);

/// The same with a reason of its own.
Failure FileFailure(const FileKind& kind, const char* doing, const std::string& path,
                    const std::string& why);

}  // namespace host
