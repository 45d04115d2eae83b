// The calls of the interface, as a host makes them: what is checked during each, and what a host
// may do wrong in making it.

#include <algorithm>
#include <string_view>

#include "hostcheck/HostCheckDevice.h"
#include "plugin/ErrorText.h"

namespace hostcheck {

namespace {

// A small device without anything special, whose flash nobody touches.
constexpr std::uint32_t kFlashBytes = 64 * 1024;
constexpr std::pair<const char*, const char*> kPublished[] = {
    {"DeviceInfoFlashSize", "64KB"},
    {"DeviceInfoRAMSize", "16KB"},
    {"DeviceInfoSectorSize", "1KB"},
    {"DeviceInfoFamily", "Host check"},
};

constexpr std::string_view kShownError = "CheckShownError";
constexpr std::string_view kReturnedError = "CheckReturnedError";
constexpr char kOperations[] = "CheckProgress | CheckShownError | CheckReturnedError";

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
        Tell(call);
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
        for (const auto& [name, value] : kPublished) {
            try {
                host_.Set(name, value);
            } catch (const Breach& breach) {
                Require(false, "SetProperty", name, breach.what());
            }
        }
        Examine(Stage::Initialize);
        initialized_ = true;
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
        NarrowAddress(address);
        Require(initialized_, call, "a call of Initialize before", "none");
        Require(loadBegun_, call, "ResetSettings before the first section", "none");
        Bytes bytes(length);
        Require(length == 0 || CopyReadable(bytes.data(), data, length), call,
                "as many bytes to read as length says", "fewer");
        host_.page = page;
        host_.loaderLoaded = host_.loaderRuns = false;
        Examine(Stage::Load);
        Note(Verdict::Holds,
             std::string(call) + ": taken, and nothing programmed: flash is as it was");
    });
}

const char* HostCheckDevice::PerformOperation(const char* operation) {
    return Guarded("PerformOperation", [&] {
        RequirePointer(operation, "operation");
        const std::string name = CheckedHost::Text(operation).value_or("");
        Require(initialized_, "PerformOperation", "a call of Initialize before", "none");
        if (name == kReturnedError)
            throw std::runtime_error("This error is returned, 100 % of it.");
        if (name == kShownError)
            Note(Verdict::Fails, "This error is shown, 100 % of it, and the operation has failed.");
        else if (std::ranges::find(kProgressOperations, name) != std::end(kProgressOperations))
            Examine(Stage::Operation);
        else
            Require(false, "PerformOperation", "a name from the list", Quoted(name));
    });
}

const char* HostCheckDevice::ResetSettings(int32_t) {
    return Guarded("ResetSettings", [&] { loadBegun_ = true; });
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
