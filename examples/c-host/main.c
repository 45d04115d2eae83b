/* A host in C99: fills the table of slots, loads the plug-in, creates a device, and does with the
 * pretend device below what the words after the library's name say, one after the other:
 *
 *     c-host [LIBRARY [WORD]...]
 *
 * KEY=VALUE changes a setting, Load programs a few bytes and compares them, every other word is the
 * name of an operation. Without a word it does a Load.
 *
 * A real host has its debug probe in the place of the pretend device.
 */

#define _POSIX_C_SOURCE 200112L /* nanosleep */

#include <flash_corvane/flash_corvane.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <time.h>

#ifdef _WIN32
#include <windows.h>
#else
#include <dlfcn.h>
#endif

enum { FlashSize = 0x10000, SectorSize = 0x400, RamSize = 0x4000, RegisterCount = 64 };

static const uint32_t RamStart = 0x20000000;
static const uint32_t FlashAddress = 0x400FD000;
static const uint32_t FlashCommand = 0x400FD008;
static const uint32_t UserRegister[2] = {0x400FE1E0, 0x400FE1E4};

struct Setting {
    char name[40];
    char value[300];
};

struct Host {
    CorvaneHost base; /* comes first, so that the two pointers are the same */
    unsigned char flash[FlashSize];
    unsigned char ram[RamSize];
    struct {
        uint32_t address, value;
    } registers[RegisterCount];
    uint32_t committed[2]; /* what a reset puts back into the user registers */
    bool running;          /* the loader, that is: there is no other program */
    struct Setting settings[32];
    int errors;
};

static struct Host* Self(CorvaneHost* host) {
    return (struct Host*)host;
}

static void Fail(const char* what, const char* text) {
    fprintf(stderr, "c-host: %s: %s\n", what, text);
    exit(1);
}

/* Settings. The plug-in has no defaults. */

static struct Setting* Find(struct Host* self, const char* name) {
    for (size_t i = 0; i < sizeof self->settings / sizeof self->settings[0]; ++i) {
        if (strcmp(self->settings[i].name, name) == 0) return &self->settings[i];
    }
    return NULL;
}

static const char* FLASH_CORVANE_CALL GetProperty(CorvaneHost* host, const char* name) {
    const struct Setting* setting = *name == '\0' ? NULL : Find(Self(host), name);
    return setting == NULL ? NULL : setting->value;
}

static const char* FLASH_CORVANE_CALL SetProperty(CorvaneHost* host, const char* name,
                                                  const char* value) {
    struct Setting* setting = Find(Self(host), name);
    if (setting == NULL) setting = Find(Self(host), ""); /* the first free one */
    if (setting == NULL || strlen(name) >= sizeof setting->name ||
        strlen(value) >= sizeof setting->value)
        return "no room for the setting";
    strcpy(setting->name, name);
    strcpy(setting->value, value);
    return NULL;
}

/* Memory: flash from 0, RAM from 0x20000000; every other word address is a register. */

static unsigned char* At(struct Host* self, uint64_t address, size_t bytes) {
    if (address + bytes <= FlashSize) return self->flash + address;
    if (address >= RamStart && address - RamStart + bytes <= RamSize)
        return self->ram + (address - RamStart);
    for (size_t i = 0; bytes == 4 && i < RegisterCount; ++i) {
        if (self->registers[i].address == 0) self->registers[i].address = (uint32_t)address;
        if (self->registers[i].address == address) return (unsigned char*)&self->registers[i].value;
    }
    return NULL;
}

static uint32_t* Register(struct Host* self, uint32_t address) {
    return (uint32_t*)(void*)At(self, address, 4);
}

/* A command of the flash controller is done at once. One without the key does nothing. */
static void CarryOutCommand(struct Host* self) {
    const uint32_t address = *Register(self, FlashAddress);
    uint32_t* command = Register(self, FlashCommand);
    if (*command == 0xA4420002) { /* erase a sector */
        if (address < FlashSize)
            memset(self->flash + address / SectorSize * SectorSize, 0xFF, SectorSize);
    } else if (*command == 0xA4420004) { /* erase everything */
        memset(self->flash, 0xFF, FlashSize);
    } else if (*command == 0xA4420008) { /* commit a user register */
        self->committed[address & 1] = *Register(self, UserRegister[address & 1]);
    } else {
        return;
    }
    *command = 0;
}

/* What FlashLoaderMerrow.out does on a real target, done at once. */
static void ServeLoader(struct Host* self) {
    for (uint32_t block = 0; self->running && block < 2; ++block) {
        uint32_t fields[4]; /* the loader's own, flash address, byte count, status */
        memcpy(fields, self->ram + 0x1000 + 16 * block, sizeof fields);
        if (fields[3] != 0xFFFFFFFF) continue;
        for (uint32_t i = 0; i < fields[2] && fields[1] + i < FlashSize; ++i)
            self->flash[fields[1] + i] &= self->ram[0x800 * block + i];
        memset(self->ram + 0x100C + 16 * block, 0, 4);
    }
}

static const char* FLASH_CORVANE_CALL ReadMemory(CorvaneHost* host, void* buffer, size_t count,
                                                 uint64_t address, int16_t page, size_t width) {
    const unsigned char* memory = At(Self(host), address, count * width);
    (void)page;
    if (memory == NULL) return "can't read target memory: nothing at that address";
    memcpy(buffer, memory, count * width);
    return NULL;
}

static const char* FLASH_CORVANE_CALL WriteMemory(CorvaneHost* host, const void* buffer,
                                                  size_t count, uint64_t address, int16_t page,
                                                  size_t width) {
    struct Host* self = Self(host);
    unsigned char* memory = At(self, address, count * width);
    (void)page;
    if (memory == NULL || address < FlashSize)
        return "can't write target memory: nothing to write at that address";
    memcpy(memory, buffer, count * width);
    CarryOutCommand(self);
    ServeLoader(self);
    return NULL;
}

/* The core. A real host waits for the loader's last chunk before it halts, resets or reads the
 * target, as minimal-host does. */

static const char* FLASH_CORVANE_CALL LoadProgram(CorvaneHost* host, const char* fileName,
                                                  const char* second, const char* directory) {
    /* The loader must not find a chunk in the RAM that nobody has handed over. */
    memset(Self(host)->ram + 0x100C, 0, 4);
    memset(Self(host)->ram + 0x101C, 0, 4);
    (void)fileName, (void)second, (void)directory;
    return NULL;
}
static const char* FLASH_CORVANE_CALL RunTarget(CorvaneHost* host) {
    Self(host)->running = true;
    return NULL;
}
static const char* FLASH_CORVANE_CALL HaltTarget(CorvaneHost* host) {
    Self(host)->running = false;
    return NULL;
}
static const char* FLASH_CORVANE_CALL ResetTarget(CorvaneHost* host, bool flag) {
    struct Host* self = Self(host);
    self->running = false; /* a reset leaves the target halted */
    *Register(self, FlashAddress) = 0;
    for (int i = 0; i < 2; ++i)
        *Register(self, UserRegister[i]) = self->committed[i];
    (void)flag;
    return NULL;
}

/* What the user sees. */

static const char* FLASH_CORVANE_CALL BeginProgress(CorvaneHost* host, const char* title) {
    (void)host;
    printf("progress: %s\n", title);
    return NULL;
}
static const char* FLASH_CORVANE_CALL UpdateProgress(CorvaneHost* host, uint32_t percent,
                                                     const char* text) {
    (void)host, (void)percent, (void)text;
    return NULL;
}
static const char* FLASH_CORVANE_CALL EndProgress(CorvaneHost* host) {
    (void)host;
    return NULL;
}
static const char* FLASH_CORVANE_CALL ShowError(CorvaneHost* host, const char* text) {
    ++Self(host)->errors;
    printf("error: %s\n", text);
    return NULL;
}
static const char* FLASH_CORVANE_CALL ShowMessage(CorvaneHost* host, const char* text) {
    (void)host;
    printf("message: %s\n", text);
    return NULL;
}

static const char* FLASH_CORVANE_CALL GetDirectory(CorvaneHost* host) {
    (void)host;
    return "./";
}
static const char* FLASH_CORVANE_CALL Pause(CorvaneHost* host, uint32_t milliseconds) {
    (void)host;
#ifdef _WIN32
    Sleep(milliseconds + 16); /* it may wake a tick of the clock early */
#else
    struct timespec left = {milliseconds / 1000, milliseconds % 1000 * 1000000L};
    while (nanosleep(&left, &left) != 0) {
    }
#endif
    return NULL;
}

/* The reserved slots stay null: nobody calls them. */
static const CorvaneHostSlots slots = {
    .GetProperty = GetProperty,
    .SetProperty = SetProperty,
    .LoadProgram = LoadProgram,
    .RunTarget = RunTarget,
    .HaltTarget = HaltTarget,
    .ResetTarget = ResetTarget,
    .ReadMemory = ReadMemory,
    .WriteMemory = WriteMemory,
    .BeginProgress = BeginProgress,
    .UpdateProgress = UpdateProgress,
    .EndProgress = EndProgress,
    .ShowError = ShowError,
    .ShowMessage = ShowMessage,
    .GetDirectory = GetDirectory,
    .Sleep = Pause,
};

/* All that the plug-in reads. What it publishes comes behind them. */
static const struct Setting defaults[] = {
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

static struct Host* NewHost(void) {
    struct Host* self = calloc(1, sizeof *self);
    if (self == NULL) Fail("starting", "out of memory");
    self->base.slots = &slots;
    memcpy(self->settings, defaults, sizeof defaults);
    memset(self->flash, 0xFF, sizeof self->flash);
    memset(self->committed, 0xFF, sizeof self->committed);
    *Register(self, 0x400FE000) = 0x000A0000; /* class field 10, Dorna */
    *Register(self, 0x400FDFC0) = 31;         /* flash: (31 + 1) * 2 KiB, in sectors of 1 KiB */
    *Register(self, 0x400FDFC4) = 63;         /* RAM: (63 + 1) * 256 bytes */
    return self;
}

static void Check(const char* what, const char* errorText) {
    if (errorText != NULL) Fail(what, errorText);
}

static void Program(struct Host* host, CorvaneDevice* device) {
    static const unsigned char data[] = "Hello, flash";
    const uint32_t address = 0x1004, length = sizeof data - 1;
    bool first = false, last = false;
    Check("address", device->slots->AddressWithinFlash(device, address, &first));
    Check("address", device->slots->AddressWithinFlash(device, address + length - 1, &last));
    if (!first || !last) Fail("planning", "the data doesn't fit into flash");

    Check("start of the load", device->slots->ResetSettings(device, 0));
    Check("programming", device->slots->WriteDataToFlash(device, data, address, length, 1));
    Check("end of the load", device->slots->ResetSettings(device, 2));
    if (host->errors != 0) return;
    printf("read back: %.*s\n", (int)length, (const char*)host->flash + address);
    if (memcmp(host->flash + address, data, length) != 0)
        Fail("comparing", "flash differs from what was programmed");
}

static void ChangeSetting(struct Host* host, const char* word) {
    const size_t length = strcspn(word, "=");
    char name[sizeof((struct Setting*)0)->name] = "";
    if (length < sizeof name) memcpy(name, word, length);
    if (*name == '\0' || Find(host, name) == NULL) Fail(word, "there is no such setting");
    Check(word, SetProperty(&host->base, name, word + length + 1));
}

/* A call that failed has returned an error text or shown an error: look at both. */
static void Do(struct Host* host, CorvaneDevice* device, const char* word) {
    if (strchr(word, '=') != NULL)
        ChangeSetting(host, word);
    else if (strcmp(word, "Load") == 0)
        Program(host, device);
    else
        Check(word, device->slots->PerformOperation(device, word));
    if (host->errors != 0) Fail(word, "the plug-in has shown an error, see above");
}

/* Loading the plug-in. The logger is found beside it. */

#ifdef _WIN32
static void* Load(const char* path) {
    char full[MAX_PATH] = ""; /* absolute and with backslashes, or the logger isn't found */
    void* library = NULL;
    GetFullPathNameA(path, sizeof full, full, NULL);
    library = LoadLibraryExA(full, NULL, LOAD_WITH_ALTERED_SEARCH_PATH);
    if (library == NULL) Fail("can't load", path);
    return library;
}
static CorvaneCreateFlashDevice2 Exported(void* library) {
    return (CorvaneCreateFlashDevice2)(void (*)(void))GetProcAddress(library, "CreateFlashDevice2");
}
static void Unload(void* library) {
    FreeLibrary(library);
}
#else
static void* Load(const char* path) {
    void* library = dlopen(path, RTLD_NOW | RTLD_LOCAL);
    if (library == NULL) Fail("loading", dlerror());
    return library;
}
static CorvaneCreateFlashDevice2 Exported(void* library) {
    CorvaneCreateFlashDevice2 create = NULL;
    *(void**)&create = dlsym(library, "CreateFlashDevice2");
    return create;
}
static void Unload(void* library) {
    dlclose(library);
}
#endif

int main(int argc, char** argv) {
    void* library = Load(argc > 1 ? argv[1] : FLASH_CORVANE_LIBRARY);
    const CorvaneCreateFlashDevice2 create = Exported(library);
    struct Host* host = NewHost();
    CorvaneDevice* device = NULL;
    bool flashAvailable = false;
    const char* operations = NULL;
    if (create == NULL) Fail("loading", "the library exports no CreateFlashDevice2");

    Check("creating", create("", "", "", &host->base, &device));
    Check("initialising", device->slots->Initialize(device, &flashAvailable, &operations));
    printf("%s, %s\n", Find(host, "DeviceInfoFamily")->value,
           Find(host, "DeviceInfoFlashSize")->value);
    if (!flashAvailable) Fail("starting", "the device has no flash");
    for (int i = 2; i < argc; ++i)
        Do(host, device, argv[i]);
    if (argc <= 2) Do(host, device, "Load");
    device->slots->Destroy(device);
    Unload(library);
    free(host);
    return 0;
}
