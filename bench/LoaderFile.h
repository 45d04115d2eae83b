// The smallest program: what is started in the simulated RAM is the loader, whatever it is.

#pragma once

#include <fmt/format.h>
#include <unistd.h>

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <initializer_list>
#include <string>

#include "base/ByteOrder.h"

namespace bench {

/// Gone with the object.
class LoaderFile {
  public:
    LoaderFile()
        : path(std::filesystem::temp_directory_path() / fmt::format("loader-{}", getpid())) {
        std::ofstream(path, std::ios::binary)
            << "\x7f"
               "ELF\1\1\1"
            << std::string(9, '\0')
            << Words({0x00280002, 1, 0x20002001, 52, 0, 0, 0x00200034, 1, 0})
            << Words({1, 84, 0x20002000, 0x20002000, 4, 4, 7, 4}) << "\xfe\xe7\xfe\xe7";
    }
    ~LoaderFile() { std::filesystem::remove(path); }
    LoaderFile(const LoaderFile&) = delete;
    LoaderFile& operator=(const LoaderFile&) = delete;

    const std::string path;

  private:
    static std::string Words(std::initializer_list<std::uint32_t> words) {
        std::string bytes;
        for (const std::uint32_t word : words)
            bytes += base::WordBytes(word);
        return bytes;
    }
};

}  // namespace bench
