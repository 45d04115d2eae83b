// DLLs.

#include "base/system/SharedLibrary.h"

#include <windows.h>

#include <filesystem>
#include <system_error>

#include "base/system/windows/Text.h"

namespace base {

namespace {

namespace fs = std::filesystem;

/// Its texts have the file as "%1", or not at all.
std::string SystemText(DWORD error, const std::string& file) {
    wchar_t* text = nullptr;
    const DWORD size =
        FormatMessageW(FORMAT_MESSAGE_ALLOCATE_BUFFER | FORMAT_MESSAGE_FROM_SYSTEM |
                           FORMAT_MESSAGE_IGNORE_INSERTS | FORMAT_MESSAGE_MAX_WIDTH_MASK,
                       nullptr, error, 0, reinterpret_cast<wchar_t*>(&text), 0, nullptr);
    std::string told = size == 0 ? "error " + std::to_string(error) : Utf8({text, size});
    LocalFree(text);
    while (told.ends_with(' ') || told.ends_with('.'))
        told.pop_back();
    const std::size_t name = told.find("%1");
    return name == std::string::npos ? file + ": " + told : told.replace(name, 2, file);
}

template <typename Type>
const Type* InModule(HMODULE module, DWORD offset) {
    return reinterpret_cast<const Type*>(reinterpret_cast<const char*>(module) + offset);
}

/// Looks in the libraries that a loaded one imports from.
FARPROC FindInImports(HMODULE module, const char* function) {
    const auto* header = InModule<IMAGE_NT_HEADERS>(
        module, static_cast<DWORD>(InModule<IMAGE_DOS_HEADER>(module, 0)->e_lfanew));
    const DWORD imports =
        header->OptionalHeader.DataDirectory[IMAGE_DIRECTORY_ENTRY_IMPORT].VirtualAddress;
    if (imports == 0) return nullptr;
    for (const auto* each = InModule<IMAGE_IMPORT_DESCRIPTOR>(module, imports); each->Name != 0;
         ++each) {
        const HMODULE imported = GetModuleHandleA(InModule<char>(module, each->Name));
        if (imported == nullptr) continue;
        if (const FARPROC found = GetProcAddress(imported, function)) return found;
    }
    return nullptr;
}

}  // namespace

std::string LibraryFileName(const std::string& name) {
    return name + ".dll";
}

// What a library needs lies beside it. Of a mere name, the program's own directory comes first.
SharedLibrary::SharedLibrary(const std::string& file) {
    const fs::path path(Utf16(file));
    std::error_code ignored;
    const bool named = path.has_parent_path();
    if (named && fs::exists(path, ignored) && !fs::is_regular_file(path, ignored))
        throw LibraryError(file + " is no regular file");
    const std::wstring full = named ? fs::absolute(path, ignored).make_preferred() : path;
    handle_.reset(LoadLibraryExW(full.c_str(), nullptr, named ? LOAD_WITH_ALTERED_SEARCH_PATH : 0));
    if (!handle_) throw LibraryError(SystemText(GetLastError(), file));
}

void* SharedLibrary::Find(const char* function) const {
    const auto module = static_cast<HMODULE>(handle_.get());
    const FARPROC found = GetProcAddress(module, function);
    return reinterpret_cast<void*>(found != nullptr ? found : FindInImports(module, function));
}

std::string SharedLibrary::FileOf(const void* function) {
    HMODULE module = nullptr;
    if (GetModuleHandleExW(
            GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
            static_cast<const wchar_t*>(function), &module) == 0)
        return "";
    std::wstring file(32768, L'\0');
    file.resize(GetModuleFileNameW(module, file.data(), static_cast<DWORD>(file.size())));
    return Utf8(file);
}

void SharedLibrary::Unloader::operator()(void* handle) const {
    FreeLibrary(static_cast<HMODULE>(handle));
}

}  // namespace base
