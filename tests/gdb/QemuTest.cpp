// The client and the example of a loader against a server and a core that are nobody's here: the
// plug-in streams an image through the loader, which QEMU executes, on a generic board with RAM
// where the flash would be. The board has no Corvane registers; a simulated device lends them.

#include <arpa/inet.h>
#include <dlfcn.h>
#include <fmt/format.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <map>
#include <string>
#include <vector>

#include "plugin/IFlashDevice2.h"
#include "target/gdb/client/GdbTarget.h"
#include "target/simulated/SimulatedDevice.h"
#include "tests/support/StrictHost.h"

namespace {

using namespace target;

/// A QEMU that waits for a client on a loopback port, and ends with this object.
class Qemu {
  public:
    Qemu() {
        const int listener = socket(AF_INET, SOCK_STREAM, 0);
        sockaddr_in name{};
        name.sin_family = AF_INET;
        name.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        socklen_t size = sizeof name;
        auto* address = reinterpret_cast<sockaddr*>(&name);
        EXPECT_EQ(bind(listener, address, size) + listen(listener, 1), 0);
        getsockname(listener, address, &size);
        port = std::to_string(ntohs(name.sin_port));
        const std::string socket = "socket,id=g,server=on,wait=off,fd=" + std::to_string(listener);
        process_ = fork();
        if (process_ == 0) {
            execlp("timeout", "timeout", "--foreground", "120", "qemu-system-arm", "-M",
                   "mps2-an385", "-S", "-display", "none", "-serial", "none", "-monitor", "none",
                   "-chardev", socket.c_str(), "-gdb", "chardev:g", nullptr);
            _exit(127);
        }
        close(listener);
    }
    ~Qemu() {
        kill(process_, SIGTERM);
        waitpid(process_, nullptr, 0);
    }
    Qemu(const Qemu&) = delete;
    Qemu& operator=(const Qemu&) = delete;

    std::string port;

  private:
    pid_t process_;
};

/// Passes on to the board what is memory, and to the simulated device what is a register.
class BoardHost final : public test::StrictHost {
  public:
    explicit BoardHost(Target& board) : board_(board), registers_(ParseDeviceOptions("quen")) {}

    std::vector<std::string> errors;

    const char* GetProperty(const char* name) override {
        static const std::map<std::string, const char*> kSettings = {
            {"FlashVerboseMode", "0"},      {"FlashResetSetting", "1"},
            {"FlashProgramCRCOption", "0"}, {"FlashProgramOption", "Do not erase"},
            {"FlashCrystalFreq", "8"},      {"FlashProgramBlankCheckOption", "0"},
            {"FlashTimeoutValue", "20"},
        };
        const auto found = kSettings.find(name);
        return found == kSettings.end() ? nullptr : found->second;
    }
    const char* SetProperty(const char*, const char*) override { return nullptr; }
    const char* LoadProgram(const char* file, const char*, const char* directory) override {
        return Answer([&] { board_.LoadProgram(file, directory); });
    }
    const char* RunTarget() override {
        return Answer([&] { board_.Run(); });
    }
    const char* HaltTarget() override {
        return Answer([&] { registers_.Halt(), board_.Halt(); });
    }
    const char* ResetTarget(bool flag) override {
        return Answer([&] { registers_.Reset(flag), board_.Reset(flag); });
    }
    const char* ReadMemory(void* buffer, size_t count, uint64_t address, int16_t page,
                           size_t width) override {
        return Answer(
            [&] { At(address).Read(buffer, count, static_cast<uint32_t>(address), page, width); });
    }
    const char* WriteMemory(const void* buffer, size_t count, uint64_t address, int16_t page,
                            size_t width) override {
        return Answer(
            [&] { At(address).Write(buffer, count, static_cast<uint32_t>(address), page, width); });
    }
    const char* BeginProgress(const char*) override { return nullptr; }
    const char* UpdateProgress(uint32_t, const char*) override { return nullptr; }
    const char* EndProgress() override { return nullptr; }
    const char* ShowError(const char* text) override {
        errors.emplace_back(text);
        return nullptr;
    }
    const char* ShowMessage(const char*) override { return nullptr; }
    const char* GetDirectory() override { return ""; }
    const char* Sleep(uint32_t milliseconds) override {
        return Answer([&] { board_.Pause(std::chrono::milliseconds(milliseconds)); });
    }

  private:
    Target& At(uint64_t address) {
        return address >= 0x40000000 ? static_cast<Target&>(registers_) : board_;
    }
    template <typename Action>
    const char* Answer(Action action) {
        try {
            action();
            return nullptr;
        } catch (const TargetError& error) {
            error_ = error.what();
            return error_.c_str();
        }
    }

    Target& board_;
    SimulatedDevice registers_;
    std::string error_;
};

void ProgramThrough(const std::string& loader) {
    Qemu qemu;
    gdb::GdbOptions options;
    gdb::ParseGdbOption("timeout=20s,ram-end=20010000,reset=system_reset", options);
    options.loader = loader;
    std::string packets;
    gdb::GdbTarget board(gdb::Address::Parse(qemu.port), options, {0x20001000, 32, 0xFFFFFFFF}, {},
                         [&](const char* direction, const std::string& packet) {
                             packets += direction + (" " + packet + "\n");
                         });
    BoardHost host(board);
    void* library = dlopen(FLASH_CORVANE_LIBRARY, RTLD_NOW);
    ASSERT_NE(library, nullptr) << dlerror();
    const auto create =
        reinterpret_cast<CreateFlashDevice2Function>(dlsym(library, "CreateFlashDevice2"));
    IFlashDevice2* device = nullptr;
    ASSERT_STREQ(create("", "", "", &host, &device), nullptr);

    std::vector<std::uint8_t> image(21 * 1024 + 77);
    for (std::size_t i = 0; i < image.size(); ++i)
        image[i] = static_cast<std::uint8_t>(i * i + i / 256);
    constexpr std::uint32_t kStart = 0x1083;
    EXPECT_STREQ(device->ResetSettings(0), nullptr);
    EXPECT_STREQ(
        device->WriteDataToFlash(image.data(), kStart, static_cast<std::uint32_t>(image.size()), 1),
        nullptr);
    device->Destroy();
    EXPECT_EQ(host.errors, std::vector<std::string>());
    board.Halt();
    std::vector<std::uint8_t> held(image.size());
    board.Read(held.data(), held.size(), kStart, 0, 1);
    EXPECT_TRUE(held == image) << packets;
    std::uint32_t blocks[8];
    board.Read(blocks, sizeof blocks, 0x20001000, 0, 1);
    EXPECT_EQ(blocks[3] | blocks[7], 0U) << "the loader reports a failure";
    board.Release(false);
}

bool Have(const std::string& command) {
    return std::system(("command -v " + command + " >/dev/null").c_str()) == 0;
}

// By GCC, too, where there is one for ARM.
TEST(Qemu, RunsTheExampleOfALoaderThroughWhichThePluginProgramsMemory) {
    const std::string loader = testing::TempDir() + "loader-" + std::to_string(getpid());
    for (const char* tool : {"qemu-system-arm", "clang", "ld.lld"})
        ASSERT_TRUE(Have(tool)) << tool << " is missing";
    for (const std::string compiler :
         {"clang --target=arm-none-eabi -fuse-ld=lld", "arm-none-eabi-gcc"}) {
        SCOPED_TRACE(compiler);
        if (compiler == "arm-none-eabi-gcc" && !Have(compiler)) continue;
        const std::string build = fmt::format("ARM_CC='{} -Wpedantic -Werror' sh {}/build.sh '{}'",
                                              compiler, EXAMPLE_LOADER, loader);
        ASSERT_EQ(std::system(build.c_str()), 0);
        ProgramThrough(loader);
    }
    unlink(loader.c_str());
}

}  // namespace
