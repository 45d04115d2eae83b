// A complete host for the flash plug-in, in C++11: loads it, creates a device, prints what it
// found, and does what the words after the library's name say, one after the other:
//
//     minimal-host [LIBRARY [WORD]...]
//
// KEY=VALUE changes a setting, Load programs a few bytes and reads them back, every other word is
// the name of an operation. Without a word it does a Load.
//
// To make a host of your own, put your debug probe in the place of PretendDevice and your user
// interface in the place of printf.

#include <flash_corvane/IFlashDevice2.h>
#include <flash_corvane/IFlashHost.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <map>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "PretendDevice.h"

#ifdef _WIN32
#include <windows.h>
#else
#include <dlfcn.h>
#endif

constexpr uint32_t StatusWords[] = {0x2000100C, 0x2000101C};  // of the loader's two blocks

// Every slot answers null for success or an error text. Exceptions must not leave a slot.
class MinimalHost final : public IFlashHost {
  public:
    // The plug-in asks twice for every value and wants the same answer both times.
    const char* GetProperty(const char* name) override {
        const auto found = settings_.find(name);
        return found == settings_.end() ? nullptr : found->second.c_str();
    }
    const char* SetProperty(const char* name, const char* value) override {
        settings_[name] = value;
        return nullptr;
    }

    // A real host loads directory + fileName into the target here, and starts it in RunTarget. The
    // loader must not find a chunk in the RAM that nobody has handed over.
    const char* LoadProgram(const char*, const char*, const char*) override {
        if (const char* error = AwaitLoader()) return error;
        const uint32_t idle = 0;
        for (const uint32_t statusWord : StatusWords)
            if (!device_.Write(&idle, statusWord, sizeof idle)) return "can't write a status word";
        return nullptr;
    }
    const char* RunTarget() override {
        device_.Run();
        loaderRuns_ = true;
        return nullptr;
    }
    const char* HaltTarget() override {
        const char* error = AwaitLoader();
        device_.Halt();
        loaderRuns_ = false;
        return error;
    }
    const char* ResetTarget(bool) override {
        const char* error = HaltTarget();
        device_.Reset();
        return error;
    }

    const char* ReadMemory(void* buffer, size_t count, uint64_t address, int16_t,
                           size_t width) override {
        if (address < 0x20000000)
            if (const char* error = AwaitLoader()) return error;  // flash is busy till then
        const bool done = device_.Read(buffer, static_cast<uint32_t>(address), count * width);
        return done ? nullptr : "can't read target memory: nothing at that address";
    }
    const char* WriteMemory(const void* buffer, size_t count, uint64_t address, int16_t,
                            size_t width) override {
        const bool done = device_.Write(buffer, static_cast<uint32_t>(address), count * width);
        return done ? nullptr : "can't write target memory: nothing to write at that address";
    }

    // An error text from UpdateProgress, "cancelled" for example, stops what is going on.
    const char* BeginProgress(const char* title) override { return Print("progress", title); }
    const char* UpdateProgress(uint32_t, const char*) override { return nullptr; }
    const char* EndProgress() override { return nullptr; }
    const char* ShowMessage(const char* text) override { return Print("message", text); }
    // A user operation or a section that failed says so here and nowhere else: remember it.
    const char* ShowError(const char* text) override {
        failed_ = true;
        return Print("error", text);
    }

    // The loader is looked for at this text + "..\..\merrow\".
    const char* GetDirectory() override { return "./"; }
    const char* Sleep(uint32_t milliseconds) override {
        std::this_thread::sleep_for(std::chrono::milliseconds(milliseconds));
        return nullptr;
    }

    const char* Reserved3() override { return nullptr; }
    const char* Reserved5() override { return nullptr; }
    const char* Reserved8() override { return nullptr; }
    const char* Reserved9() override { return nullptr; }
    const char* Reserved12() override { return nullptr; }
    const char* Reserved13() override { return nullptr; }
    const char* Reserved14() override { return nullptr; }
    const char* Reserved15() override { return nullptr; }

    bool Failed() const { return failed_; }
    const std::string& Setting(const std::string& name) const { return settings_.at(name); }
    bool Has(const std::string& name) const { return settings_.count(name) != 0; }

  private:
    // The plug-in doesn't wait for the last chunk, and a halt would lose it. So wait until no
    // status word says "to do", but only if a loader was started: the words are arbitrary before.
    const char* AwaitLoader() {
        using Clock = std::chrono::steady_clock;
        const auto until =
            Clock::now() + std::chrono::seconds(std::stoi(settings_["FlashTimeoutValue"]));
        for (const uint32_t statusWord : StatusWords)
            for (uint32_t status = 0; loaderRuns_; Sleep(5)) {
                if (!device_.Read(&status, statusWord, sizeof status))
                    return "can't read a status word";
                if (status != 0xFFFFFFFF) break;
                if (Clock::now() > until) return "the loader doesn't finish its last chunk";
            }
        return nullptr;
    }

    static const char* Print(const char* kind, const char* text) {
        std::printf("%s: %s\n", kind, text);
        return nullptr;
    }

    PretendDevice device_;
    bool failed_ = false;
    bool loaderRuns_ = false;
    // The plug-in has no defaults: what it reads and the host doesn't know is a failure.
    std::map<std::string, std::string> settings_ = {
        {"FlashProgramOption", "Necessary Pages Only"},
        {"FlashProgramBlankCheckOption", "1"},
        {"FlashProgramCRCOption", "1"},
        {"FlashEraseType", "By Address Range"},
        {"FlashEraseStartAddr", "0"},
        {"FlashEraseEndAddr", "0"},
        {"FlashBlankCheckSelection", "Entire Flash"},
        {"FlashBlankCheckStartAddr", "0"},
        {"FlashBlankCheckEndAddr", "0"},
        {"FlashChecksumSelection", "Entire Flash"},
        {"FlashChecksumStartAddr", "0"},
        {"FlashChecksumEndAddr", "0"},
        {"FlashMACAddrInput", "ff-ff-ff-ff-ff-ff"},
        {"FlashMACAddrCommit", "0"},
        {"FlashUserRegister0Input", "ffffffff"},
        {"FlashUserRegister0Commit", "0"},
        {"FlashUserRegister1Input", "ffffffff"},
        {"FlashUserRegister1Commit", "0"},
        {"FlashCrystalFreq", "8"},
        {"FlashTimeoutValue", "30"},
        {"FlashResetSetting", "1"},
        {"FlashVerboseMode", "0"},
    };
};

// The error text belongs to the plug-in and lives until its next failing call: copy it at once.
static void Check(const char* what, const char* errorText) {
    if (errorText != nullptr) throw std::runtime_error(std::string(what) + ": " + errorText);
}

static void ProgramAndReadBack(MinimalHost& host, IFlashDevice2& device) {
    const std::string data = "Hello, flash";
    const uint32_t address = 0x1004;
    const auto* bytes = reinterpret_cast<const unsigned char*>(data.data());
    const auto length = static_cast<uint32_t>(data.size());

    // Not the overload with a size: its upper bound is one too strict.
    bool first = false, last = false;
    Check("address", device.AddressWithinFlash(address, &first));
    Check("address", device.AddressWithinFlash(address + length - 1, &last));
    if (!first || !last) throw std::runtime_error("the data doesn't fit into flash");

    Check("start of the load", device.ResetSettings(0));
    Check("programming", device.WriteDataToFlash(bytes, address, length, 1));
    Check("end of the load", device.ResetSettings(2));
    if (host.Failed()) throw std::runtime_error("the plug-in has shown an error, see above");

    std::string readBack(data.size(), '\0');
    Check("reading back", host.ReadMemory(&readBack[0], readBack.size(), address, 0, 1));
    std::printf("read back: %s\n", readBack.c_str());
    if (readBack != data) throw std::runtime_error("flash differs from what was programmed");
}

// An operation that failed and said so has returned no error: look at both.
static void Perform(MinimalHost& host, IFlashDevice2& device, const std::string& operation) {
    Check(operation.c_str(), device.PerformOperation(operation.c_str()));
    if (host.Failed()) throw std::runtime_error("the plug-in has shown an error, see above");
}

static void Do(MinimalHost& host, IFlashDevice2& device, const std::string& word) {
    const std::size_t equals = word.find('=');
    const std::string name = word.substr(0, equals);
    if (equals != std::string::npos && !host.Has(name))
        throw std::runtime_error("there is no setting " + name);
    if (equals != std::string::npos)
        Check("setting", host.SetProperty(name.c_str(), word.c_str() + equals + 1));
    else if (word == "Load")
        ProgramAndReadBack(host, device);
    else
        Perform(host, device, word);
}

static void UseDevice(MinimalHost& host, IFlashDevice2& device,
                      const std::vector<std::string>& words) {
    bool flashAvailable = false;
    const char* operations = nullptr;
    Check("initialising", device.Initialize(&flashAvailable, &operations));
    for (const char* name : {"DeviceInfoFamily", "DeviceInfoFlashSize", "DeviceInfoSectorSize"})
        std::printf("%s: %s\n", name, host.Setting(name).c_str());
    std::printf("operations: %s\n", operations);
    if (!flashAvailable) throw std::runtime_error("the device has no flash");
    for (const std::string& word : words)
        Do(host, device, word);
}

// The plug-in's library. Its logger is found beside it.
class Library {
  public:
#ifdef _WIN32
    explicit Library(const char* path) {
        char full[MAX_PATH] = "";  // absolute and with backslashes, or the logger isn't found
        GetFullPathNameA(path, sizeof full, full, nullptr);
        handle_ = LoadLibraryExA(full, nullptr, LOAD_WITH_ALTERED_SEARCH_PATH);
        if (handle_ == nullptr) throw std::runtime_error(std::string("can't load ") + path);
    }
    ~Library() {
        FreeLibrary(handle_);
    }
    void* Find(const char* name) const {
        return reinterpret_cast<void*>(GetProcAddress(handle_, name));
    }

  private:
    HMODULE handle_;
#else
    explicit Library(const char* path) : handle_(dlopen(path, RTLD_NOW | RTLD_LOCAL)) {
        if (handle_ == nullptr) throw std::runtime_error(dlerror());
    }
    ~Library() {
        dlclose(handle_);
    }
    void* Find(const char* name) const {
        return dlsym(handle_, name);
    }

  private:
    void* handle_;
#endif
    Library(const Library&) = delete;
};

// Only Destroy ends a device, and it must have run before the library is unloaded.
struct Destroyer {
    void operator()(IFlashDevice2* device) const { device->Destroy(); }
};
using Device = std::unique_ptr<IFlashDevice2, Destroyer>;

static Device CreateDevice(const Library& library, MinimalHost& host) {
    const auto create =
        reinterpret_cast<CreateFlashDevice2Function>(library.Find("CreateFlashDevice2"));
    if (create == nullptr) throw std::runtime_error("the library has no CreateFlashDevice2");
    IFlashDevice2* device = nullptr;
    Check("creating the device", create("", "", "", &host, &device));
    return Device(device);
}

int main(int argc, char** argv) try {
    const Library library(argc > 1 ? argv[1] : FLASH_CORVANE_LIBRARY);
    MinimalHost host;
    std::vector<std::string> words(argv + std::min(argc, 2), argv + argc);
    if (words.empty()) words.push_back("Load");
    UseDevice(host, *CreateDevice(library, host), words);
} catch (const std::exception& error) {
    std::fprintf(stderr, "minimal-host: %s\n", error.what());
    return 1;
}
