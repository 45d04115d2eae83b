// Files of Windows, under the numbers that the C library gives them. Everybody may read and
// delete what another has open, as on other systems.

#include "base/system/Files.h"

#include <fcntl.h>
#include <io.h>
#include <windows.h>

#include <algorithm>
#include <cerrno>
#include <random>

#include "base/system/Paths.h"
#include "base/system/windows/Text.h"

namespace base {

namespace {

constexpr DWORD kShareAll = FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE;

HANDLE HandleOf(int file) {
    return reinterpret_cast<HANDLE>(_get_osfhandle(file));
}

bool Succeeded(BOOL result) {
    if (result == 0) SetErrno();
    return result != 0;
}

/// A handle that is closed when it goes.
class Handle {
  public:
    explicit Handle(HANDLE handle) : handle_(handle) {}
    ~Handle() {
        if (IsOpen()) CloseHandle(handle_);
    }
    Handle(const Handle&) = delete;
    Handle& operator=(const Handle&) = delete;

    bool IsOpen() const { return handle_ != INVALID_HANDLE_VALUE; }
    HANDLE Get() const { return handle_; }

  private:
    const HANDLE handle_;
};

Descriptor Open(const std::string& path, DWORD access, DWORD disposition,
                DWORD flags = FILE_ATTRIBUTE_NORMAL) {
    const HANDLE handle = CreateFileW(SystemPath(path).c_str(), access, kShareAll, nullptr,
                                      disposition, flags, nullptr);
    if (handle != INVALID_HANDLE_VALUE)
        return Descriptor(
            _open_osfhandle(reinterpret_cast<std::intptr_t>(handle), _O_BINARY | _O_NOINHERIT));
    SetErrno();
    const int error = errno;
    const auto status = error == EACCES ? StatusOf(path) : std::nullopt;
    errno = status && status->type == FileType::Other ? EISDIR : error;
    return Descriptor();
}

std::optional<FileStatus> StatusOfHandle(HANDLE handle) {
    const DWORD type = GetFileType(handle);
    FileStatus status{};
    if (type == FILE_TYPE_CHAR || type == FILE_TYPE_PIPE) {
        status.type = type == FILE_TYPE_CHAR ? FileType::CharacterDevice : FileType::Pipe;
        // They have no number; no other file has this one.
        status.number = reinterpret_cast<std::uintptr_t>(handle);
        return status;
    }
    BY_HANDLE_FILE_INFORMATION found{};
    if (!Succeeded(GetFileInformationByHandle(handle, &found))) return std::nullopt;
    const bool directory = (found.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
    status.type = directory ? FileType::Other : FileType::Regular;
    status.sizeBytes = std::uint64_t{found.nFileSizeHigh} << 32 | found.nFileSizeLow;
    status.device = found.dwVolumeSerialNumber;
    status.number = std::uint64_t{found.nFileIndexHigh} << 32 | found.nFileIndexLow;
    status.names = found.nNumberOfLinks;
    status.readOnly = (found.dwFileAttributes & FILE_ATTRIBUTE_READONLY) != 0;
    return status;
}

Handle OpenToLook(const std::string& path, DWORD access = 0) {
    return Handle(CreateFileW(SystemPath(path).c_str(), access, kShareAll, nullptr, OPEN_EXISTING,
                              FILE_FLAG_BACKUP_SEMANTICS, nullptr));
}

bool IsLink(const std::string& path) {
    const DWORD attributes = GetFileAttributesW(SystemPath(path).c_str());
    return attributes != INVALID_FILE_ATTRIBUTES &&
           (attributes & FILE_ATTRIBUTE_REPARSE_POINT) != 0;
}

/// The name of a file that is there, all links followed; empty when the system doesn't tell.
std::string FinalPath(const std::string& path) {
    const Handle file = OpenToLook(path);
    if (!file.IsOpen()) return "";
    std::wstring name(32768, L'\0');
    name.resize(GetFinalPathNameByHandleW(file.Get(), name.data(), static_cast<DWORD>(name.size()),
                                          VOLUME_NAME_DOS));
    if (name.starts_with(L"\\\\?\\UNC\\")) return Utf8(L"\\\\" + name.substr(8));
    return Utf8(name.starts_with(L"\\\\?\\") ? name.substr(4) : name);
}

bool IsConsole(HANDLE handle) {
    DWORD mode = 0;
    return GetConsoleMode(handle, &mode) != 0;
}

/// Whether a pipe holds something, or has no writer any more.
bool HasSomething(HANDLE pipe) {
    DWORD bytes = 0;
    return PeekNamedPipe(pipe, nullptr, 0, nullptr, &bytes, nullptr) == 0 || bytes != 0;
}

/// Consoles take UTF-16, whatever code page they show.
std::optional<std::size_t> WriteToConsole(HANDLE console, std::string_view bytes) {
    const std::wstring text = Utf16(bytes);
    DWORD written = 0;
    if (!Succeeded(WriteConsoleW(console, text.data(), static_cast<DWORD>(text.size()), &written,
                                 nullptr)))
        return std::nullopt;
    return bytes.size();
}

OVERLAPPED At(std::uint64_t offset) {
    OVERLAPPED where{};
    where.Offset = static_cast<DWORD>(offset);
    where.OffsetHigh = static_cast<DWORD>(offset >> 32);
    return where;
}

DWORD Limited(std::size_t bytes) {
    return static_cast<DWORD>(std::min<std::size_t>(bytes, std::size_t{1} << 30));
}

/// ReadFile, where the end of a pipe is an end like any other.
std::optional<std::size_t> Read(int file, std::span<char> room, OVERLAPPED* where) {
    DWORD count = 0;
    if (ReadFile(HandleOf(file), room.data(), Limited(room.size()), &count, where) != 0)
        return count;
    const DWORD error = GetLastError();
    if (error == ERROR_BROKEN_PIPE || error == ERROR_HANDLE_EOF) return 0;
    errno = ErrorNumber(error);
    return std::nullopt;
}

bool Rename(const std::string& from, const std::string& to, DWORD flags) {
    return Succeeded(MoveFileExW(SystemPath(from).c_str(), SystemPath(to).c_str(),
                                 flags | MOVEFILE_WRITE_THROUGH));
}

}  // namespace

bool Descriptor::Close() {
    return !IsOpen() || _close(std::exchange(number_, -1)) == 0;
}

std::optional<FileStatus> StatusOf(const std::string& path) {
    const Handle file = OpenToLook(path);
    if (file.IsOpen()) return StatusOfHandle(file.Get());
    SetErrno();
    return std::nullopt;
}

std::optional<FileStatus> StatusOf(int file) {
    return StatusOfHandle(HandleOf(file));
}

std::string FollowLinks(const std::string& path) {
    const std::string file = IsLink(path) ? FinalPath(path) : "";
    return file.empty() ? path : file;
}

// The case of letters, short names and drives that stand for others are the file's own.
std::string CanonicalPath(const std::string& path) {
    std::string file = FinalPath(path);
    if (!file.empty()) return file;
    std::error_code error;
    const auto full = std::filesystem::absolute(PathOf(path), error);
    const std::string directory = error ? "" : FinalPath(NameOf(full.parent_path()));
    if (error || directory.empty()) return error ? "" : NameOf(full);
    return directory + (directory.ends_with('\\') ? "" : "\\") + NameOf(full.filename());
}

std::vector<std::string> RegularFilesIn(const std::string& directory) {
    constexpr DWORD kOthers =
        FILE_ATTRIBUTE_DIRECTORY | FILE_ATTRIBUTE_REPARSE_POINT | FILE_ATTRIBUTE_DEVICE;
    std::vector<std::string> names;
    WIN32_FIND_DATAW found{};
    const HANDLE search = FindFirstFileW(SystemPath(directory + "/*").c_str(), &found);
    if (search == INVALID_HANDLE_VALUE) return names;
    do {
        if ((found.dwFileAttributes & kOthers) == 0) names.push_back(Utf8(found.cFileName));
    } while (FindNextFileW(search, &found) != 0);
    FindClose(search);
    return names;
}

bool IsSameFile(const FileStatus& one, const FileStatus& other) {
    return one.type == other.type && one.device == other.device && one.number == other.number;
}

bool MayWrite(const std::string& path) {
    // Of a directory this is the right to add files.
    const Handle file = OpenToLook(path, FILE_WRITE_DATA);
    if (!file.IsOpen()) SetErrno();
    return file.IsOpen();
}

Descriptor OpenToRead(const std::string& path) {
    return Open(path, GENERIC_READ, OPEN_EXISTING);
}

Descriptor OpenToWrite(const std::string& path) {
    return Open(path, GENERIC_WRITE, OPEN_ALWAYS);
}

Descriptor OpenNew(const std::string& path) {
    return Open(path, GENERIC_READ | GENERIC_WRITE, CREATE_NEW);
}

Descriptor OpenBehindNoLink(const std::string& path) {
    if (IsLink(path)) {
        errno = ELOOP;
        return Descriptor();
    }
    return Open(path, GENERIC_READ, OPEN_EXISTING, FILE_FLAG_OPEN_REPARSE_POINT);
}

Descriptor OpenTemporary(std::string& path) {
    constexpr std::string_view kLetters = "abcdefghijklmnopqrstuvwxyz0123456789";
    constexpr std::size_t kCount = 6;
    constexpr int kAttempts = 100;
    std::random_device random;
    Descriptor file;
    for (int i = 0; i < kAttempts && !file.IsOpen() && (i == 0 || errno == EEXIST); ++i) {
        std::generate(path.end() - kCount, path.end(),
                      [&] { return kLetters[random() % kLetters.size()]; });
        file = OpenNew(path);
    }
    return file;
}

// The system tells of sockets and consoles when they are ready, of pipes only when it is asked.
// What is written to a pipe that nobody reads waits for its reader.
bool AwaitFile(int file, Ready ready, std::chrono::milliseconds time) {
    constexpr DWORD kLookMs = 10;
    const HANDLE handle = HandleOf(file);
    if (ready == Ready::ToWrite) return true;
    if (IsConsole(handle))
        return WaitForSingleObject(handle, static_cast<DWORD>(time.count())) == WAIT_OBJECT_0;
    if (GetFileType(handle) != FILE_TYPE_PIPE) return true;
    const auto end = std::chrono::steady_clock::now() + time;
    while (!HasSomething(handle)) {
        if (std::chrono::steady_clock::now() >= end) return false;
        Sleep(kLookMs);
    }
    return true;
}

std::optional<std::size_t> ReadFrom(int file, std::span<char> room) {
    return Read(file, room, nullptr);
}

std::optional<std::size_t> WriteTo(int file, std::string_view bytes) {
    const HANDLE handle = HandleOf(file);
    if (IsConsole(handle)) return WriteToConsole(handle, bytes);
    DWORD count = 0;
    if (!Succeeded(WriteFile(handle, bytes.data(), Limited(bytes.size()), &count, nullptr)))
        return std::nullopt;
    return count;
}

std::optional<std::size_t> ReadBeginning(int file, std::span<char> room) {
    OVERLAPPED where = At(0);
    return Read(file, room, &where);
}

bool MakeEmpty(int file) {
    return _chsize_s(file, 0) == 0;
}

// Locks keep others from reading what is locked, so this one lies where no file has anything.
LockState TryLock(int file) {
    OVERLAPPED where = At(std::uint64_t{1} << 62);
    if (LockFileEx(HandleOf(file), LOCKFILE_EXCLUSIVE_LOCK | LOCKFILE_FAIL_IMMEDIATELY, 0, 1, 0,
                   &where) != 0)
        return LockState::Locked;
    const DWORD error = GetLastError();
    errno = ErrorNumber(error);
    return error == ERROR_LOCK_VIOLATION || error == ERROR_IO_PENDING ? LockState::Busy
                                                                      : LockState::Impossible;
}

// A new file has the rights that its directory hands down.
void TakeOver(int, const std::optional<FileStatus>&) {}

bool Sync(int file) {
    return Succeeded(FlushFileBuffers(HandleOf(file)));
}

// A file that somebody has open can't be replaced. The tool has none open for longer than it takes
// to read it, so that it is worth while to try again.
bool RenameOver(const std::string& from, const std::string& to) {
    constexpr std::chrono::seconds kPatience{2};
    constexpr DWORD kBetweenMs = 5;
    const auto end = std::chrono::steady_clock::now() + kPatience;
    while (!Rename(from, to, MOVEFILE_REPLACE_EXISTING)) {
        const bool inUse = errno == EACCES || errno == EBUSY;
        if (!inUse || std::chrono::steady_clock::now() >= end) return false;
        Sleep(kBetweenMs);
    }
    return true;
}

bool RenameToNew(const std::string& from, const std::string& to) {
    return Rename(from, to, 0);
}

bool Remove(const std::string& path) {
    return Succeeded(DeleteFileW(SystemPath(path).c_str()));
}

}  // namespace base
