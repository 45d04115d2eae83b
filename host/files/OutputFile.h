// Writing files: whole or not at all, and never over one that is there unless that is wanted.

#pragma once

#include <string>
#include <string_view>

#include "base/system/Descriptor.h"
#include "host/files/FileKind.h"

namespace host {

enum class Existing { Keep, Replace };

/// What can be known before the work begins: that there is a file which is to be kept (Failure,
/// WrongUsage), or one that may not be written (Failure, of the kind's status).
void RequireWritable(const FileKind& kind, const std::string& path, Existing existing);

/// Writes the file through a temporary one beside it: whoever looks finds the old contents or the
/// new ones, after a crash as well. A link stays one, and owner and permissions stay as they are.
/// What is no regular file (a pipe, a device) is written directly.
void WriteWholeFile(const FileKind& kind, const std::string& path, std::string_view contents,
                    Existing existing);

/// Removes the temporary files that killed runs have left beside a file; nobody may be writing it.
void RemoveLeftovers(const std::string& path);

/// Opens a file to write into as it grows: a new one, one that is there (its contents stay for the
/// caller to judge), or a pipe, whose reader is waited for.
base::Descriptor OpenForWriting(const FileKind& kind, const std::string& path);

}  // namespace host
