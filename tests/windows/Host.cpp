// A host that writes down every call it gets and every answer it is given. Compiled for Linux and
// for Microsoft's ABI it must write the same, whatever the compiler of the plug-in was. Then it
// loads and unloads the plug-in more often than a process has thread-local indices.

#include <flash_corvane/IFlashDevice2.h>
#include <flash_corvane/IFlashHost.h>
#include <flash_corvane/ostrel_logger.h>

#include "tests/windows/System.h"

namespace {

constexpr int kLoads = 2000;

struct Setting {
    const char* name;
    const char* value;
};
constexpr Setting kSettings[] = {
    {"FlashProgramOption", "Necessary Pages Only"},
    {"FlashProgramBlankCheckOption", "1"},
    {"FlashProgramCRCOption", "1"},
    {"FlashEraseType", "Entire Flash"},
    {"FlashBlankCheckSelection", "By Address Range"},
    {"FlashBlankCheckStartAddr", "0x100"},
    {"FlashBlankCheckEndAddr", "0x4FFFF"},
    {"FlashChecksumSelection", "Entire Flash"},
    {"FlashUserRegister0Input", "89ABCDEF"},
    {"FlashUserRegister0Commit", "1"},
    {"FlashResetSetting", "1"},
    {"FlashTimeoutValue", "5"},
    {"FlashVerboseMode", "1"},
};

constexpr uint32_t kFlashSize = 4096, kRam = 0x20000000, kBlocks = 0x1000, kPending = 0xFFFFFFFF;
unsigned char flash[kFlashSize];
unsigned char ram[kBlocks + 2 * 16];

// A device of class Dorna with 4 KiB of flash. Every command erases all of it, at once.
constexpr uint64_t kFlashCommand = 0x400FD008;

uint32_t Register(uint32_t address) {
    switch (address) {
        case 0x400FE000:
            return 0x000A0000;
        case 0x400FDFC0:
            return kFlashSize / 2048 - 1;
        case 0x400FD008:
            return 0;
        default:
            return address ^ 0x5A5A5A5A;
    }
}

unsigned char* Memory(uint64_t address) {
    if (address < kFlashSize) return flash + address;
    if (address >= kRam && address - kRam < sizeof ram) return ram + (address - kRam);
    return nullptr;
}

void ServeLoader() {
    for (uint32_t block = 0; block < 2; ++block) {
        unsigned char* parameters = ram + kBlocks + block * 16;
        uint32_t fields[4];
        memcpy(fields, parameters, sizeof fields);
        if (fields[3] != kPending) continue;
        memcpy(Memory(fields[1]), ram + block * 2048, fields[2]);
        memset(parameters + 12, 0, 4);
    }
}

uint32_t Sum(const void* buffer, size_t bytes) {
    uint32_t sum = 1;
    for (size_t i = 0; i < bytes; ++i)
        sum = sum * 31 + static_cast<const unsigned char*>(buffer)[i];
    return sum;
}

#define SAY(...) (printf(__VA_ARGS__), nullptr)

class TranscriptHost final : public IFlashHost {
  public:
    const char* lost = nullptr;  ///< what a read says from now on

    const char* GetProperty(const char* name) override {
        for (const Setting& setting : kSettings) {
            if (strcmp(setting.name, name) != 0) continue;
            printf("0 GetProperty %s: %s\n", name, setting.value);
            return setting.value;
        }
        return SAY("0 GetProperty %s: unknown\n", name);
    }
    const char* SetProperty(const char* name, const char* value) override {
        return SAY("1 SetProperty %s %s\n", name, value);
    }
    const char* LoadProgram(const char* file, const char* second, const char* place) override {
        return SAY("2 LoadProgram %s '%s' %s\n", file, second, place);
    }
    const char* RunTarget() override { return SAY("4 RunTarget\n"); }
    const char* HaltTarget() override { return SAY("6 HaltTarget\n"); }
    const char* ResetTarget(bool flag) override { return SAY("7 ResetTarget %d\n", flag); }
    const char* ReadMemory(void* buffer, size_t count, uint64_t address, int16_t page,
                           size_t width) override {
        const uint32_t value = Register(static_cast<uint32_t>(address));
        const unsigned char* memory = Memory(address);
        if (memory == nullptr) memory = reinterpret_cast<const unsigned char*>(&value);
        memcpy(buffer, memory, count * width);
        Transfer("10 ReadMemory", buffer, count, address, page, width);
        return lost;
    }
    const char* WriteMemory(const void* buffer, size_t count, uint64_t address, int16_t page,
                            size_t width) override {
        Transfer("11 WriteMemory", buffer, count, address, page, width);
        if (Memory(address) != nullptr) memcpy(Memory(address), buffer, count * width);
        if (address == kFlashCommand) memset(flash, 0xFF, sizeof flash);
        ServeLoader();
        return nullptr;
    }
    const char* BeginProgress(const char* title) override {
        return SAY("16 BeginProgress %s\n", title);
    }
    const char* UpdateProgress(uint32_t percent, const char* text) override {
        return SAY("17 UpdateProgress %u %s\n", percent, text);
    }
    const char* EndProgress() override { return SAY("18 EndProgress\n"); }
    const char* ShowError(const char* text) override { return SAY("19 ShowError %s\n", text); }
    const char* ShowMessage(const char* text) override { return SAY("20 ShowMessage %s\n", text); }
    const char* GetDirectory() override {
        printf("21 GetDirectory\n");
        return "C:\\host\\";
    }
    const char* Sleep(uint32_t milliseconds) override { return SAY("22 Sleep %u\n", milliseconds); }

    const char* Reserved3() override { exit(3); }
    const char* Reserved5() override { exit(5); }
    const char* Reserved8() override { exit(8); }
    const char* Reserved9() override { exit(9); }
    const char* Reserved12() override { exit(12); }
    const char* Reserved13() override { exit(13); }
    const char* Reserved14() override { exit(14); }
    const char* Reserved15() override { exit(15); }

  private:
    static void Transfer(const char* slot, const void* buffer, size_t count, uint64_t address,
                         int page, size_t width) {
        printf("%s %u x %u at %08X%08X page %d: %08X\n", slot, static_cast<unsigned>(count),
               static_cast<unsigned>(width), static_cast<unsigned>(address >> 32),
               static_cast<unsigned>(address), page, Sum(buffer, count * width));
    }
};

void Say(const char* what, const char* error) {
    printf("= %s: %s\n", what, error == nullptr ? "done" : error);
    fflush(nullptr);  // so that nothing is lost if the next call is the last
}

void AskAbout(IFlashDevice2& device) {
    constexpr uint64_t addresses[] = {0, 0xFFF, 0x1000, 0xFFFFFFFF, 0x100000000};
    constexpr int32_t sizes[] = {1, -1, -2147483647 - 1};
    bool answer = false;
    const char* operations = "";
    Say("Initialize", device.Initialize(&answer, &operations));
    printf("%d %s\n", answer, operations);
    for (const uint64_t address : addresses) {
        Say("AddressWithinFlash", device.AddressWithinFlash(address, &answer));
        printf("%d\n", answer);
        for (const int32_t size : sizes) {
            Say("AddressWithinFlash of a range", device.AddressWithinFlash(address, size, &answer));
            printf("%d\n", answer);
        }
        answer = true;
        Say("AddressWithinSpecialRegion", device.AddressWithinSpecialRegion(address, &answer));
        printf("%d\n", answer);
    }
}

void WorkWith(IFlashDevice2& device) {
    constexpr int32_t modes[] = {-5, 1};
    constexpr int16_t pages[] = {3, -2, -32767 - 1};
    constexpr const char* names[] = {"Erase",
                                     "BlankCheck",
                                     "CalculateChecksum",
                                     "ReadUserRegister0",
                                     "ProgramUserRegister0",
                                     "ReadMACAddress",
                                     "Erase the moon"};
    constexpr uint16_t words[] = {1, 2};
    unsigned char image[3000];
    for (size_t i = 0; i < sizeof image; ++i)
        image[i] = static_cast<unsigned char>(i * 7);

    for (const int32_t mode : modes)
        Say("ResetSettings", device.ResetSettings(mode));
    for (const int16_t page : pages) {
        Say("ResetSettings", device.ResetSettings(0));
        Say("WriteDataToFlash", device.WriteDataToFlash(image, 0x1F, sizeof image, page));
    }
    Say("WriteDataToFlash of words", device.WriteDataToFlash(words, 0x1F, 2, -2));
    Say("WriteDataToFlash too far", device.WriteDataToFlash(image, 0x100000000, 2, -2));
    Say("ResetSettings", device.ResetSettings(2));
    for (const char* name : names)
        Say(name, device.PerformOperation(name));
}

void Sink(void* context, int level, const char* text) {
    printf("%s %d %s\n", static_cast<const char*>(context), level, text);
}

IFlashDevice2* Create(void* plugin, TranscriptHost& host) {
    const auto create = reinterpret_cast<CreateFlashDevice2Function>(
        plugin == nullptr ? nullptr : Find(plugin, "CreateFlashDevice2"));
    if (create == nullptr) printf("no plug-in\n"), exit(1);
    IFlashDevice2* device = nullptr;
    Say("CreateFlashDevice2", create("variant", "", "", &host, &device));
    return device;
}

void WriteTranscript(TranscriptHost& host) {
    void* plugin = Load(kPlugin);
    void* logger = Load(kLogger);
    char context[] = "trace";
    using SetSink = void (*)(OstrelLoggerSink, void*);
    const auto setSink = reinterpret_cast<SetSink>(Find(logger, "OstrelLoggerSetSink"));
    setSink(Sink, context);
    IFlashDevice2* device = Create(plugin, host);
    AskAbout(*device);
    WorkWith(*device);
    host.lost = "the target is lost";
    Say("BlankCheck", device->PerformOperation("BlankCheck"));
    device->Destroy();
    setSink(nullptr, nullptr);
    Unload(logger);
    Unload(plugin);
}

// Each failing creation throws an exception inside the plug-in, and asks its logger.
void LoadAndUnload(TranscriptHost& host) {
    for (int load = 0; load < kLoads; ++load) {
        void* plugin = Load(kPlugin);
        if (Create(plugin, host) != nullptr) exit(1);
        Unload(plugin);
        if (IsLoaded(kPlugin) || IsLoaded(kLogger)) printf("still loaded\n"), exit(1);
    }
}

}  // namespace

int main() {
    TranscriptHost host;
    WriteTranscript(host);
    LoadAndUnload(host);
    return 0;
}

#if defined(_WIN32)
extern "C" void mainCRTStartup() {
    _setmode(1, 0x8000 /* _O_BINARY */);
    exit(main());
}
#endif
