// Reading memory of this process that may not be there.

#pragma once

#include <cstddef>

namespace base {

/// Copies bytes that may lie anywhere. False, and nothing that counts is written, when they can't
/// be read.
bool CopyReadable(void* to, const void* from, std::size_t bytes);

}  // namespace base
