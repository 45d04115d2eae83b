// One trace line for each slot.

#include "host/driver/TracingHost.h"

#include <fmt/format.h>

#include <cstdint>

namespace host {

namespace {

std::string Bytes(const void* buffer, size_t count, size_t width) {
    const auto* bytes = static_cast<const std::uint8_t*>(buffer);
    std::uint64_t value = 0;
    if (count != 1 || width > sizeof value) return fmt::format("{} bytes", count * width);
    for (size_t i = width; i-- > 0;)
        value = value << 8 | bytes[i];
    return fmt::format("{:#0{}x}", value, 2 + 2 * width);
}

std::string Access(const char* name, size_t count, uint64_t address, int16_t page, size_t width) {
    return fmt::format("{} {:#010x}, {} x {}, page {}", name, address, count, width, page);
}

}  // namespace

const char* TracingHost::Answer(const std::string& call, const char* error) {
    trace_.Line("host", error == nullptr ? call : fmt::format("{} -> error: {}", call, error));
    return error;
}

const char* TracingHost::GetProperty(const char* name) {
    const char* value = next_.GetProperty(name);
    trace_.Line("host", value == nullptr ? fmt::format("GetProperty {} -> unknown", name)
                                         : fmt::format("GetProperty {} = \"{}\"", name, value));
    return value;
}

const char* TracingHost::SetProperty(const char* name, const char* value) {
    return Answer(fmt::format("SetProperty {} = \"{}\"", name, value),
                  next_.SetProperty(name, value));
}

const char* TracingHost::LoadProgram(const char* fileName, const char* second,
                                     const char* directory) {
    return Answer(fmt::format(R"(LoadProgram "{}", "{}", "{}")", fileName, second, directory),
                  next_.LoadProgram(fileName, second, directory));
}

const char* TracingHost::RunTarget() {
    return Answer("RunTarget", next_.RunTarget());
}

const char* TracingHost::HaltTarget() {
    return Answer("HaltTarget", next_.HaltTarget());
}

const char* TracingHost::ResetTarget(bool flag) {
    return Answer(fmt::format("ResetTarget {}", flag), next_.ResetTarget(flag));
}

const char* TracingHost::ReadMemory(void* buffer, size_t count, uint64_t address, int16_t page,
                                    size_t width) {
    const char* error = next_.ReadMemory(buffer, count, address, page, width);
    const std::string call = Access("ReadMemory", count, address, page, width);
    return Answer(error == nullptr ? call + " = " + Bytes(buffer, count, width) : call, error);
}

const char* TracingHost::WriteMemory(const void* buffer, size_t count, uint64_t address,
                                     int16_t page, size_t width) {
    const std::string call = Access("WriteMemory", count, address, page, width);
    return Answer(call + " = " + Bytes(buffer, count, width),
                  next_.WriteMemory(buffer, count, address, page, width));
}

const char* TracingHost::BeginProgress(const char* title) {
    return Answer(fmt::format("BeginProgress \"{}\"", title), next_.BeginProgress(title));
}

const char* TracingHost::UpdateProgress(uint32_t percent, const char* text) {
    return Answer(fmt::format("UpdateProgress {} %, \"{}\"", percent, text),
                  next_.UpdateProgress(percent, text));
}

const char* TracingHost::EndProgress() {
    return Answer("EndProgress", next_.EndProgress());
}

const char* TracingHost::ShowError(const char* text) {
    return Answer(fmt::format("ShowError \"{}\"", text), next_.ShowError(text));
}

const char* TracingHost::ShowMessage(const char* text) {
    return Answer(fmt::format("ShowMessage \"{}\"", text), next_.ShowMessage(text));
}

const char* TracingHost::GetDirectory() {
    const char* directory = next_.GetDirectory();
    trace_.Line("host", fmt::format("GetDirectory = \"{}\"", directory));
    return directory;
}

const char* TracingHost::Sleep(uint32_t milliseconds) {
    return Answer(fmt::format("Sleep {} ms", milliseconds), next_.Sleep(milliseconds));
}

}  // namespace host
