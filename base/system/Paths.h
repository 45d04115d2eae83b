// File names as texts, which are UTF-8 on each system. Of a plain text the C++ library believes
// that it is in the system's code page.

#pragma once

#include <filesystem>
#include <string>

namespace base {

inline std::filesystem::path PathOf(const std::string& name) {
    return std::u8string(name.begin(), name.end());
}

inline std::string NameOf(const std::filesystem::path& path) {
    const std::u8string name = path.u8string();
    return {name.begin(), name.end()};
}

}  // namespace base
