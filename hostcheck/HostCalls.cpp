// The calls of the interface, as a host makes them: what is checked during each, and what a host
// may do wrong in making it.

#include <algorithm>
#include <string_view>

#include "base/system/ReadableMemory.h"
#include "hostcheck/HostCheckDevice.h"
#include "hostcheck/Limits.h"
#include "plugin/ErrorText.h"

namespace hostcheck {

namespace {

constexpr std::uint32_t kFlashBytes = 64 * 1024;

constexpr std::string_view kLoaderOperation = "CheckLoader";
constexpr std::string_view kShownError = "CheckShownError";
constexpr std::string_view kReturnedError = "CheckReturnedError";
constexpr char kOperations[] = "CheckProgress | CheckLoader | CheckShownError | CheckReturnedError";

// The names that a host may have built in.
constexpr std::string_view kProgressOperations[] = {"CheckProgress",        "Erase",
                                                    "BlankCheck",           "CalculateChecksum",
                                                    "ProgramUserRegister0", "ReadUserRegister0",
                                                    "ProgramUserRegister1", "ReadUserRegister1",
                                                    "ProgramMACAddress",    "ReadMACAddress"};

std::uint32_t NarrowAddress(uint64_t address) {
    if (address > 0xFFFFFFFF) throw std::runtime_error("Address value is too big");
    return static_cast<std::uint32_t>(address);
}

void RequirePointer(const void* pointer, const char* name) {
    if (pointer == nullptr)
        throw std::runtime_error(std::string("expected a pointer for ") + name + "; came null");
}

}  // namespace

template <typename Body>
const char* HostCheckDevice::Guarded(const char* call, Body body) {
    if (busy_.exchange(true)) {
        calledWhileBusy_ = true;
        return "called before another call of the same device has returned";
    }
    const char* answer = nullptr;
    try {
        body();
        Require(!calledWhileBusy_.exchange(false), call,
                "no other call before this one has returned",
                "one, from a slot or from another thread");
        report_.RequireShown();
    } catch (const std::exception& error) {
        answer = KeepErrorText(lastError_, error.what());
    }
    busy_ = false;
    return answer;
}

const char* HostCheckDevice::Initialize(bool* flashAvailable, const char** operations) {
    return Guarded("Initialize", [&] {
        RequirePointer(flashAvailable, "flashAvailable");
        RequirePointer(operations, "operations");
        report_.Open();
        Examine("Initialize", {Stage::Initialize}, kUnseenAtStart);
        *flashAvailable = true;
        *operations = kOperations;
    });
}

const char* HostCheckDevice::AddressWithinFlash(uint64_t address, bool* within) {
    return Guarded("AddressWithinFlash", [&] {
        RequirePointer(within, "within");
        *within = NarrowAddress(address) < kFlashBytes;
    });
}

const char* HostCheckDevice::AddressWithinFlash(uint64_t address, int32_t size, bool* within) {
    return Guarded("AddressWithinFlash", [&] {
        RequirePointer(within, "within");
        const std::uint32_t first = NarrowAddress(address);
        *within = first < kFlashBytes && first + static_cast<std::uint32_t>(size) < kFlashBytes;
    });
}

const char* HostCheckDevice::WriteDataToFlash(const uint16_t*, uint64_t, uint32_t, int16_t) {
    return "Unsupported target data type";
}

const char* HostCheckDevice::WriteDataToFlash(const unsigned char* data, uint64_t address,
                                              uint32_t length, int16_t page) {
    constexpr char call[] = "WriteDataToFlash";
    return Guarded(call, [&] {
        const std::uint32_t first = NarrowAddress(address);
        report_.Open();
        RequireSection(data, first, length);
        const bool atFirst = load_.AtFirstSection();
        const std::string expected = load_.Section();
        Require(expected.empty(), call, expected, "none");
        host_.page = page;
        if (atFirst)
            Examine(call, {Stage::LoadBegins, Stage::LoaderStart, Stage::LoaderEnd},
                    kUnseenInALoad);
        report_.Say(std::string(call) + ": " + std::to_string(length) + " bytes for " +
                    HexWord(first) + " taken, and nothing programmed: flash is as it was");
    });
}

void HostCheckDevice::RequireSection(const void* data, std::uint32_t address,
                                     std::uint32_t length) {
    constexpr char call[] = "WriteDataToFlash";
    Require(length != 0, call, "no section of length 0", "one");
    const bool inFlash = address < kFlashBytes && length <= kFlashBytes - address;
    Require(inFlash, call, "a section in the 64 KiB of flash that AddressWithinFlash tells of",
            std::to_string(length) + " bytes for " + HexWord(address));
    if (!inFlash) return;
    Bytes bytes(length);
    Require(length == 0 || base::CopyReadable(bytes.data(), data, length), call,
            "as many bytes to read as length says", "fewer");
}

const char* HostCheckDevice::PerformOperation(const char* operation) {
    return Guarded("PerformOperation", [&] {
        RequirePointer(operation, "operation");
        const auto name = ReadableText(operation);
        if (!name) throw std::runtime_error("expected a text for operation; came none");
        report_.Open();
        CheckNamedOperation(*name);
    });
}

void HostCheckDevice::CheckNamedOperation(const std::string& name) {
    if (name == kReturnedError)
        throw std::runtime_error("This error is returned, 100 % of it, %s and %d.");
    if (name == kShownError) {
        report_.SayAsError(
            "This error is shown, 100 % of it, %s and %d, and the operation has failed.");
    } else if (name == kLoaderOperation) {
        loaderChecked_ = true;
        host_.page = kGeneralPage;
        Examine("CheckLoader", {Stage::LoaderStart, Stage::LoaderWork, Stage::LoaderEnd},
                kUnseenInTheLoader);
    } else if (std::ranges::find(kProgressOperations, name) != std::end(kProgressOperations)) {
        displaysChecked_ = true;
        Examine("PerformOperation", {Stage::Display}, kUnseenInDisplays);
    } else {
        Require(false, "PerformOperation", "a name from the list", Quoted(name));
    }
}

const char* HostCheckDevice::ResetSettings(int32_t mode) {
    return Guarded("ResetSettings", [&] {
        report_.Open();
        const bool completed = load_.Completed();
        const std::string expected = load_.Reset(mode);
        Require(expected.empty(), "ResetSettings", expected, std::to_string(mode));
        if (load_.Completed() && !completed)
            report_.Say("ResetSettings: ok: 0, sections and 2, which is a whole load");
    });
}

const char* HostCheckDevice::AddressWithinSpecialRegion(uint64_t address, bool* result) {
    return Guarded("AddressWithinSpecialRegion", [&] {
        RequirePointer(result, "result");
        NarrowAddress(address);
        *result = false;
    });
}

void HostCheckDevice::Destroy() {
    delete this;
}

}  // namespace hostcheck
