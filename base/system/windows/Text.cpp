// Conversions. What is no UTF-8 becomes a replacement character, as in all of Windows.

#include "base/system/windows/Text.h"

#include <windows.h>

#include <cerrno>

extern "C" NTSYSAPI LONG NTAPI RtlGetLastNtStatus();

namespace base {

std::wstring Utf16(std::string_view text) {
    const int size = static_cast<int>(text.size());
    std::wstring wide(
        static_cast<std::size_t>(MultiByteToWideChar(CP_UTF8, 0, text.data(), size, nullptr, 0)),
        L'\0');
    MultiByteToWideChar(CP_UTF8, 0, text.data(), size, wide.data(), static_cast<int>(wide.size()));
    return wide;
}

std::string Utf8(std::wstring_view text) {
    const int size = static_cast<int>(text.size());
    std::string narrow(static_cast<std::size_t>(WideCharToMultiByte(CP_UTF8, 0, text.data(), size,
                                                                    nullptr, 0, nullptr, nullptr)),
                       '\0');
    WideCharToMultiByte(CP_UTF8, 0, text.data(), size, narrow.data(),
                        static_cast<int>(narrow.size()), nullptr, nullptr);
    return narrow;
}

// Longer paths than this need the prefix, which wants them absolute. It would rob names of devices
// ("NUL") of their meaning, so that shorter ones don't get it.
std::wstring SystemPath(const std::string& path) {
    constexpr std::size_t kLength = 240;
    std::wstring given = Utf16(path);
    std::wstring full(32768, L'\0');
    full.resize(
        GetFullPathNameW(given.c_str(), static_cast<DWORD>(full.size()), full.data(), nullptr));
    if (full.size() < kLength || full.starts_with(L"\\\\?\\") || full.starts_with(L"\\\\.\\"))
        return given;
    if (full.starts_with(L"\\\\")) return L"\\\\?\\UNC" + full.substr(1);
    return L"\\\\?\\" + full;
}

int ErrorNumber(unsigned long error) {
    constexpr LONG kDeletePending = static_cast<LONG>(0xC0000056);
    switch (error) {
        case ERROR_SUCCESS:
            return 0;
        case ERROR_ACCESS_DENIED:
            // The file goes away when the last one who has it open closes it.
            return RtlGetLastNtStatus() == kDeletePending ? ENOENT : EACCES;
        case ERROR_FILE_NOT_FOUND:
        case ERROR_PATH_NOT_FOUND:
        case ERROR_INVALID_NAME:
        case ERROR_BAD_PATHNAME:
        case ERROR_BAD_NETPATH:
        case ERROR_INVALID_DRIVE:
            return ENOENT;
        case ERROR_ALREADY_EXISTS:
        case ERROR_FILE_EXISTS:
            return EEXIST;
        case ERROR_SHARING_VIOLATION:
        case ERROR_LOCK_VIOLATION:
            return EBUSY;
        case ERROR_WRITE_PROTECT:
            return EROFS;
        case ERROR_HANDLE_DISK_FULL:
        case ERROR_DISK_FULL:
            return ENOSPC;
        case ERROR_BROKEN_PIPE:
        case ERROR_PIPE_NOT_CONNECTED:
        case ERROR_NO_DATA:
            return EPIPE;
        case ERROR_INVALID_HANDLE:
            return EBADF;
        case ERROR_NOT_ENOUGH_MEMORY:
        case ERROR_OUTOFMEMORY:
            return ENOMEM;
        case ERROR_TOO_MANY_OPEN_FILES:
            return EMFILE;
        case ERROR_CANT_RESOLVE_FILENAME:
            return ELOOP;
        case ERROR_DIRECTORY:
            return ENOTDIR;
        case ERROR_FILENAME_EXCED_RANGE:
            return ENAMETOOLONG;
        case ERROR_INVALID_PARAMETER:
            return EINVAL;
        default:
            return EIO;
    }
}

void SetErrno() {
    errno = ErrorNumber(GetLastError());
}

}  // namespace base
