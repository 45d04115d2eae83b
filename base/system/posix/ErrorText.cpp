// The C library's texts.

#include "base/system/ErrorText.h"

#include <system_error>

namespace base {

std::string ErrorText(int error) {
    return std::generic_category().message(error);
}

}  // namespace base
