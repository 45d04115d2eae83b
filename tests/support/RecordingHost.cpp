#include "tests/support/RecordingHost.h"

#include <dlfcn.h>
#include <fmt/format.h>

#include <cstdlib>
#include <cstring>

#include "logger/ostrel_logger.h"
#include "tests/support/Cases.h"

namespace test {

namespace {

std::string TransferText(const char* verb, size_t count, uint64_t address, int16_t page,
                         size_t width) {
    return fmt::format("{} {}x{} 0x{:08X} page {}", verb, count, width, address, page);
}

// What a transfer moved, as far as a reader of a transcript wants to see it.
std::string BytesText(const void* buffer, size_t count, size_t width) {
    const auto* bytes = static_cast<const uint8_t*>(buffer);
    if (count * width == 4 && width == 4) {
        std::uint32_t word = 0;
        std::memcpy(&word, buffer, sizeof word);
        return fmt::format(" = 0x{:08X}", word);
    }
    std::string text = " =";
    for (size_t i = 0; i < count * width && i < 12; ++i)
        text += fmt::format(" {:02X}", bytes[i]);
    return count * width > 12 ? text + " ..." : text;
}

}  // namespace

const Settings& OrdinarySettings() {
    static const Settings settings = ReadSettings("support/settings.txt");
    return settings;
}

RecordingHost::RecordingHost(const std::string& deviceOptions, Settings changes)
    : settings(std::move(changes)),
      device_(std::make_unique<target::SimulatedDevice>(target::ParseDeviceOptions(deviceOptions),
                                                        &clock_)),
      target_(device_.get()) {
    settings.insert(OrdinarySettings().begin(), OrdinarySettings().end());
    OstrelLoggerSetSink(
        [](void* self, int level, const char* text) {
            static_cast<RecordingHost*>(self)->NoteTrace(level, text);
        },
        this);
}

RecordingHost::~RecordingHost() {
    OstrelLoggerSetSink(nullptr, nullptr);
}

void RecordingHost::Restart(Fault next) {
    fault = std::move(next);
    calls = 0;
    failedCalls.clear();
    errors.clear();
    messages.clear();
    transcript.clear();
}

void RecordingHost::Note(const std::string& line) {
    if (transcribe) transcript.push_back(line);
}

void RecordingHost::NoteTrace(int level, std::string text) {
    if (!transcribe) return;
    if (data != nullptr) {
        const std::string pointer = fmt::format("{}", data);
        if (const auto at = text.find(pointer); at != std::string::npos) {
            text.replace(at, pointer.size(), "DATA");
        }
    }
    Note(fmt::format("    trace {} {}", level, text));
}

bool RecordingHost::Fails(const std::string& line) {
    ++calls;
    bool fails = fault.first != 0 && calls >= fault.first && calls - fault.first < fault.count;
    if (!failNext.empty() && line.starts_with(failNext)) {
        failNext.clear();
        fails = true;
    }
    if (fails) failedCalls.push_back(line);
    return fails;
}

// Every text that is handed out lives in the same memory, which the next call overwrites: whoever
// keeps a pointer to it is found out.
const char* RecordingHost::Answer(const std::string& line, const std::function<void()>& action) {
    std::fill(answer_.begin(), answer_.end(), '#');
    bytesRead_.clear();
    if (Fails(line)) {
        Note(line + " ! " + fault.text);
        answer_ = fault.text;
        return answer_.c_str();
    }
    try {
        action();
        Note(line + bytesRead_);
        return nullptr;
    } catch (const target::TargetError& error) {
        Note(line + " ! " + error.what());
        answer_ = error.what();
        return answer_.c_str();
    }
}

const char* RecordingHost::GetProperty(const char* name) {
    std::fill(answer_.begin(), answer_.end(), '#');
    const auto found = settings.find(name);
    if (Fails(std::string("get ") + name) || found == settings.end()) {
        Note(fmt::format("get {} ! unknown", name));
        return nullptr;
    }
    Note(fmt::format("get {} = \"{}\"", name, found->second));
    answer_ = found->second;
    return answer_.c_str();
}

const char* RecordingHost::SetProperty(const char* name, const char* value) {
    return Answer(fmt::format("set {} = \"{}\"", name, value), [&] { settings[name] = value; });
}

const char* RecordingHost::LoadProgram(const char* fileName, const char* second,
                                       const char* directory) {
    return Answer(fmt::format(R"(load "{}" "{}" "{}")", fileName, second, directory),
                  [&] { target_->LoadProgram(fileName, directory); });
}

const char* RecordingHost::RunTarget() {
    return Answer("run", [&] { target_->Run(); });
}

const char* RecordingHost::HaltTarget() {
    return Answer("halt", [&] { target_->Halt(); });
}

const char* RecordingHost::ResetTarget(bool flag) {
    return Answer(fmt::format("reset {}", flag), [&] { target_->Reset(flag); });
}

const char* RecordingHost::ReadMemory(void* buffer, size_t count, uint64_t address, int16_t page,
                                      size_t width) {
    return Answer(TransferText("read", count, address, page, width), [&] {
        target_->Read(buffer, count, static_cast<std::uint32_t>(address), page, width);
        bytesRead_ = BytesText(buffer, count, width);
    });
}

const char* RecordingHost::WriteMemory(const void* buffer, size_t count, uint64_t address,
                                       int16_t page, size_t width) {
    const std::string line = TransferText("write", count, address, page, width);
    return Answer(line + BytesText(buffer, count, width), [&] {
        target_->Write(buffer, count, static_cast<std::uint32_t>(address), page, width);
    });
}

const char* RecordingHost::BeginProgress(const char* title) {
    return Answer(fmt::format("begin \"{}\"", title),
                  [&] { displayMisused |= openDisplays++ != 0; });
}

const char* RecordingHost::UpdateProgress(uint32_t percent, const char* text) {
    displayMisused |= openDisplays != 1;
    return Answer(fmt::format("update {} \"{}\"", percent, text));
}

// An end that fails is an end all the same.
const char* RecordingHost::EndProgress() {
    displayMisused |= --openDisplays != 0;
    return Answer("end");
}

const char* RecordingHost::ShowError(const char* text) {
    errors.emplace_back(text);
    return Answer(fmt::format("error \"{}\"", text));
}

const char* RecordingHost::ShowMessage(const char* text) {
    messages.emplace_back(text);
    return Answer(fmt::format("message \"{}\"", text));
}

const char* RecordingHost::GetDirectory() {
    Note("directory");
    answer_ = R"(C:\host\)";
    return answer_.c_str();
}

const char* RecordingHost::Sleep(uint32_t milliseconds) {
    return Answer(fmt::format("sleep {}", milliseconds),
                  [&] { target_->Pause(std::chrono::milliseconds(milliseconds)); });
}

CreateFlashDevice2Function Factory() {
    static const auto factory = [] {
        void* library = dlopen(FLASH_CORVANE_LIBRARY, RTLD_NOW | RTLD_LOCAL);
        if (library == nullptr) throw std::runtime_error(dlerror());
        return reinterpret_cast<CreateFlashDevice2Function>(dlsym(library, "CreateFlashDevice2"));
    }();
    return factory;
}

Plugin::Plugin(IFlashHost& host) {
    IFlashDevice2* device = nullptr;
    const char* error = Factory()("variant", "second", "third", &host, &device);
    if (error != nullptr) throw std::runtime_error(error);
    device_.reset(device);
}

}  // namespace test
