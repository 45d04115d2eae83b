// The C library's texts, and those of Linux for what it has no text for.

#include "base/system/ErrorText.h"

#include <cerrno>
#include <system_error>

namespace base {

std::string ErrorText(int error) {
    switch (error) {
        case EADDRINUSE:
            return "Address already in use";
        case EADDRNOTAVAIL:
            return "Cannot assign requested address";
        case EAFNOSUPPORT:
            return "Address family not supported by protocol";
        case ECONNABORTED:
            return "Software caused connection abort";
        case ECONNREFUSED:
            return "Connection refused";
        case ECONNRESET:
            return "Connection reset by peer";
        case ELOOP:
            return "Too many levels of symbolic links";
        case EHOSTUNREACH:
            return "No route to host";
        case ENETDOWN:
            return "Network is down";
        case ENETUNREACH:
            return "Network is unreachable";
        case ENOBUFS:
            return "No buffer space available";
        case ENOTCONN:
            return "Transport endpoint is not connected";
        case ETIMEDOUT:
            return "Connection timed out";
        default:
            return std::generic_category().message(error);
    }
}

}  // namespace base
