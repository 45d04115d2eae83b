#include "tests/hostcheck/CheckedHosts.h"

#include <dlfcn.h>

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <thread>

#include "tests/support/Cases.h"
#include "tests/support/FailingMemory.h"
#include "tests/support/VirtualTime.h"

namespace test {

namespace {

constexpr uint32_t kStatus[] = {0x100C, 0x101C};
constexpr uint32_t kRomControl = 0x400FE0F0;
constexpr uint32_t kToDo = 0xFFFFFFFF;

// The library that is loaded takes its memory in this process, too.
char givenBack[80];

}  // namespace

const char* Dangling(const std::string& text) {
    onAllocation = [] { std::memset(givenBack, '#', sizeof givenBack - 1); };
    std::snprintf(givenBack, sizeof givenBack, "%s", text.c_str());
    return givenBack;
}

PretendTarget::PretendTarget() {
    for (size_t i = 0; i < flash.size(); ++i)
        flash[i] = static_cast<unsigned char>(i * 5 + i / 256);
}

bool PretendTarget::Pending(unsigned block) const {
    return std::memcmp(&ram[kStatus[block]], &kToDo, 4) == 0;
}

void PretendTarget::SetStatus(unsigned block, uint32_t status) {
    std::memcpy(&ram[kStatus[block]], &status, 4);
}

void PretendTarget::Serve() {
    for (; running && Pending(turn_); turn_ ^= 1) {
        if (begun_.count() < 0) begun_ = VirtualNow();
        if (VirtualNow() - begun_ < chunkTime) return;
        begun_ = std::chrono::nanoseconds(-1);
        uint32_t chunk[2];  // address, length
        std::memcpy(chunk, &ram[0x1004 + 16 * turn_], sizeof chunk);
        for (size_t i = 0; i < chunk[1]; ++i)
            flash.at(chunk[0] + i) &= ram[0x800 * turn_ + i];
        SetStatus(turn_, 0);
    }
}

const char* PretendTarget::Move(const Transfer& t) {
    Serve();
    const size_t bytes = t.count * t.width;
    std::vector<unsigned char>& memory = t.address < flash.size() ? flash : ram;
    const uint64_t offset = t.address - (&memory == &ram ? kRam : 0);
    void* at = nullptr;
    if (offset < memory.size() && bytes <= memory.size() - offset)
        at = &memory[offset];
    else if (t.address >= 0x400F0000 && bytes == 4)
        at = &registers[t.address];
    if (at == nullptr) return "no memory";
    if (t.to == nullptr)
        std::memcpy(at, t.from, bytes);
    else
        std::memcpy(t.to, at, bytes);
    if (t.to != nullptr && at == &memory[offset] && &memory == &flash && romInFront)
        std::memset(t.to, 0x20, bytes);
    if (t.to == nullptr && t.address == kRomControl) {  // ones clear
        romInFront = false;
        registers[kRomControl] = 0;
    }
    Serve();
    return nullptr;
}

void PretendTarget::Run() {
    running = true;
    turn_ = 0;
    begun_ = std::chrono::nanoseconds(-1);
}

void PretendTarget::Halt() {
    Serve();
    running = false;
}

void PretendTarget::Reset() {
    Halt();
    registers[0x400FD000] = 0;
    registers[kRomControl] = 1;
    romInFront = true;
}

CheckedHost::CheckedHost() {
    settings = ReadSettings("hostcheck/settings.txt");
    get = [this](const char* name) {
        return settings.contains(name) ? settings[name].c_str() : nullptr;
    };
    set = [this](const char* name, const char* value) {
        settings[name] = value;
        return nullptr;
    };
    load = [this] {
        for (const unsigned block : {0U, 1U})
            target.SetStatus(block, 0);
        return target.running ? "the target runs" : nullptr;
    };
    run = [this] {
        target.Run();
        loaderRuns = true;
        return nullptr;
    };
    halt = [this] {
        const char* const error = AwaitLoader();
        target.Halt();
        loaderRuns = false;
        return error;
    };
    reset = [this](bool) {
        const char* const error = halt();
        target.Reset();
        return error;
    };
    begin = [this] { return displaysOpen++ == 0 ? nullptr : "a display is open"; };
    update = [this] { return displaysOpen == 1 ? nullptr : "no display is open"; };
    end = [this] { return displaysOpen-- == 1 ? nullptr : "no display is open"; };
    Fail(directory, "/");
    move = [this](const Transfer& t) {
        if (t.address < target.flash.size() && AwaitLoader() != nullptr) return "flash is busy";
        return target.Move(t);
    };
    sleep = [](uint32_t milliseconds) {
        std::this_thread::sleep_for(std::chrono::milliseconds(milliseconds));
        return nullptr;
    };
}

const char* CheckedHost::AwaitLoader() {
    const auto until = VirtualNow() + std::chrono::seconds(1);
    while (loaderRuns && (target.Pending(0) || target.Pending(1))) {
        if (VirtualNow() > until) return "the loader hangs";
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
        target.Serve();
    }
    return nullptr;
}

const char* CheckedHost::ShowError(const char* text) {
    lines.push_back(std::string("error: ") + text);
    return errorsFail ? "no display" : nullptr;
}

const char* CheckedHost::ShowMessage(const char* text) {
    lines.emplace_back(text);
    return message(text);
}

bool CheckedHost::Told(const std::string& text) const {
    return std::ranges::any_of(
        lines, [&](const std::string& line) { return line.find(text) != std::string::npos; });
}

std::string CheckedHost::Faults(const Calls& calls) {
    void* library = dlopen(FLASH_HOST_CHECK_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    const auto create =
        reinterpret_cast<CreateFlashDevice2Function>(dlsym(library, "CreateFlashDevice2"));
    IFlashDevice2* device = nullptr;
    const auto returned = [&](const char* text) {
        if (text != nullptr) lines.push_back(std::string("returned: ") + text);
    };
    returned(create("", "", "", this, &device));
    if (calls) {
        returned(calls(*device));
    } else {
        bool flag = false;
        const char* names = nullptr;
        const unsigned char data = 0;
        returned(device->Initialize(&flag, &names));
        returned(device->PerformOperation("CheckProgress"));
        returned(device->ResetSettings(0));
        returned(device->WriteDataToFlash(&data, 0, 1, 1));
        returned(device->ResetSettings(2));
        returned(device->PerformOperation("CheckLoader"));
    }
    device->Destroy();
    dlclose(library);
    std::string faults;
    for (const std::string& line : lines)
        if (line.starts_with("error: ") || line.starts_with("returned: ")) faults += line + "\n";
    return faults;
}

}  // namespace test
