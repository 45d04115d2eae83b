#include "bench/AddedFlash.h"

#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <random>
#include <stdexcept>
#include <vector>

#include "bench/DelayLine.h"
#include "bench/LoaderFile.h"
#include "bench/ProbeServer.h"

namespace bench {

namespace {

using Clock = std::chrono::steady_clock;
using Seconds = std::chrono::duration<double>;

constexpr std::size_t kSizeBytes = std::size_t{256} * 1024;
constexpr std::uint32_t kAddress = 0x4103;  // as odd as sections come

/// A device of its own for each load.
struct Board {
    Board(int delayMs, int chunkMs)
        : server(fmt::format("dorna,flash=512K,latency=1ns,bandwidth=0,chunk-time={}ms", chunkMs),
                 false),
          line(server.Where(), std::chrono::milliseconds(delayMs)) {}

    ProbeServer server;
    DelayLine line;
    LoaderFile loader;
};

/// A program of its own, and what it says at first; it ends with the object.
class Background {
  public:
    explicit Background(std::vector<std::string> words) {
        std::array<int, 2> ends{};
        if (pipe(ends.data()) != 0) throw std::runtime_error("no pipe");
        process_ = fork();
        if (process_ == 0) {
            dup2(ends[1], STDOUT_FILENO);
            std::vector<char*> arguments;
            for (std::string& word : words)
                arguments.push_back(word.data());
            arguments.push_back(nullptr);
            execvp(arguments[0], arguments.data());
            _exit(127);
        }
        close(ends[1]);
        char byte = 0;
        while (byte != '\n' && read(ends[0], &byte, 1) == 1)
            said += byte;
        close(ends[0]);
    }
    ~Background() {
        kill(process_, SIGTERM);
        waitpid(process_, nullptr, 0);
    }
    Background(const Background&) = delete;
    Background& operator=(const Background&) = delete;

    std::string said;

  private:
    pid_t process_ = 0;
};

Seconds TimeOf(const std::string& command) {
    const auto begin = Clock::now();
    if (std::system(command.c_str()) != 0) throw std::runtime_error("failed: " + command);
    return Clock::now() - begin;
}

/// The same bytes for the tool and, as a section, for the debugger.
class ImageFiles {
  public:
    ImageFiles()
        : directory_(std::filesystem::temp_directory_path() / fmt::format("image-{}", getpid())) {
        std::filesystem::create_directory(directory_);
        std::mt19937 numbers;
        std::string bytes(kSizeBytes, '\0');
        for (char& byte : bytes)
            byte = static_cast<char>(numbers());
        std::ofstream(Binary(), std::ios::binary) << bytes;
        TimeOf(
            fmt::format("arm-none-eabi-objcopy -I binary -O elf32-littlearm -B arm "
                        "--set-section-flags .data=alloc,load,contents "
                        "--change-section-address .data={:#x} '{}' '{}'",
                        kAddress, Binary(), Elf()));
    }
    ~ImageFiles() { std::filesystem::remove_all(directory_); }
    ImageFiles(const ImageFiles&) = delete;
    ImageFiles& operator=(const ImageFiles&) = delete;

    std::string Binary() const { return directory_ / "image.bin"; }
    std::string Elf() const { return directory_ / "image.elf"; }
    std::string Time() const { return directory_ / "time"; }

  private:
    std::filesystem::path directory_;
};

Seconds TimeOfProgram(const Board& board, const ImageFiles& image) {
    return TimeOf(fmt::format("'{}' --gdb {} --loader '{}' program '{}' --base {:x} >/dev/null",
                              CORVANE_TOOL, board.line.Where().Text(), board.loader.path,
                              image.Binary(), kAddress));
}

/// Of the command alone, once the debugger is connected.
Seconds TimeOfLoad(const Board& board, const ImageFiles& image) {
    const Background server({CORVANE_TOOL, "--gdb", board.line.Where().Text(), "--loader",
                             board.loader.path, "serve", "0"});
    const std::string::size_type end = server.said.find(';');
    const std::string::size_type begin = server.said.rfind(':', end) + 1;
    TimeOf(
        fmt::format("gdb-multiarch -nx -batch -ex 'set architecture armv7e-m' "
                    "-ex 'target remote :{}' -ex 'python import time; begin = time.time()' "
                    "-ex load -ex 'python print(time.time() - begin, file=open(\"{}\", \"w\"))' "
                    "-ex detach '{}' >/dev/null 2>&1",
                    server.said.substr(begin, end - begin), image.Time(), image.Elf()));
    double seconds = 0;
    if (!(std::ifstream(image.Time()) >> seconds)) throw std::runtime_error("GDB loaded nothing");
    return Seconds(seconds);
}

}  // namespace

Table AddedFlashTable() {
    const ImageFiles image;
    Table table("added-flash",
                "Programming 256 KiB through a GDB server's socket, in s: \"program\", and GDB's "
                "\"load\" through added flash",
                {"delay ms", "chunk ms", "program", "load", "load/program"});
    for (const int delayMs : {0, 1, 3})
        for (const int chunkMs : {5, 20}) {
            const Seconds program = TimeOfProgram(Board(delayMs, chunkMs), image);
            const Seconds load = TimeOfLoad(Board(delayMs, chunkMs), image);
            table.Add({delayMs, chunkMs, program.count(), load.count(), load / program});
        }
    return table;
}

}  // namespace bench
