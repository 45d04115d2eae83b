// What a file or a socket is awaited for.

#pragma once

namespace base {

enum class Ready { ToRead, ToWrite };

}  // namespace base
