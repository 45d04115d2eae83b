// Files that are open, by their numbers (those of the standard streams included), and files that
// have names. Whatever fails leaves the reason in errno, as a number of <cerrno>.

#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "base/system/Descriptor.h"
#include "base/system/Ready.h"

namespace base {

enum class FileType {
    Regular,
    Pipe,             ///< a named one, or one of a shell
    CharacterDevice,  ///< a terminal, or where everything written vanishes
    Other
};

struct FileStatus {
    FileType type;
    std::uint64_t sizeBytes;
    std::uint64_t device;  ///< with the number: which file it is, under all its names
    std::uint64_t number;
    std::uint64_t names;  ///< how many names the file has (hard links)
    unsigned permissions;
    unsigned owner;
    unsigned group;
    bool readOnly;  ///< for everybody
};

/// The file behind all links.
std::optional<FileStatus> StatusOf(const std::string& path);
std::optional<FileStatus> StatusOf(int file);

/// The file that a symbolic link leads to, be it there or not; the path itself when it is no link.
std::string FollowLinks(const std::string& path);

/// The one name of a file, whichever way leads to it, be it there or not; empty when that can't be
/// told.
std::string CanonicalPath(const std::string& path);

/// The names of the regular files in a directory, without links; none when it can't be read.
std::vector<std::string> RegularFilesIn(const std::string& directory);

bool IsSameFile(const FileStatus& one, const FileStatus& other);

/// Whether this user may write the file, or make files in the directory.
bool MayWrite(const std::string& path);

/// Opens without waiting: neither for a pipe's writer, nor for its reader (then errno is ENXIO).
/// A file to write is made where there is none; one that is there keeps its contents.
Descriptor OpenToRead(const std::string& path);
Descriptor OpenToWrite(const std::string& path);

/// A file that wasn't there; one that is there is EEXIST, links included.
Descriptor OpenNew(const std::string& path);

/// A file that is there, to read; a link is an error.
Descriptor OpenBehindNoLink(const std::string& path);

/// Makes a file that nobody else has. The path ends with "XXXXXX", which becomes a text of letters
/// and digits that is in no other name.
Descriptor OpenTemporary(std::string& path);

/// Waits until reading or writing doesn't. False when that wasn't so within the time.
bool AwaitFile(int file, Ready ready, std::chrono::milliseconds time);

/// How many bytes came or went; 0 at the end of the file. Nothing, with EAGAIN, when none can just
/// now. Of a file that is ready to be written as much is taken as goes without waiting.
std::optional<std::size_t> ReadFrom(int file, std::span<char> room);
std::optional<std::size_t> WriteTo(int file, std::string_view bytes);

/// What is at the beginning of a file, wherever it is read.
std::optional<std::size_t> ReadBeginning(int file, std::span<char> room);

bool MakeEmpty(int file);

enum class LockState { Locked, Busy, Impossible };

/// Locks a file for as long as it is open. The lock keeps nobody from reading or writing it.
LockState TryLock(int file);

/// Gives a file the owner and the permissions of the one that it is to replace, as far as this user
/// may; without one, those of any new file.
void TakeOver(int file, const std::optional<FileStatus>& old);

/// Puts what was written where a loss of power doesn't take it.
bool Sync(int file);

/// Gives a file another name in the same directory, in one step: whoever looks finds the one or the
/// other. RenameToNew fails with EEXIST when there is a file of that name.
bool RenameOver(const std::string& from, const std::string& to);
bool RenameToNew(const std::string& from, const std::string& to);

bool Remove(const std::string& path);

}  // namespace base
