// The command line and the environment, of which the C library has no more than the code page's
// characters.

#include "base/system/Environment.h"

#include <windows.h>
// It needs what stands above.
#include <shellapi.h>

#include <algorithm>
#include <memory>

#include "base/system/windows/Text.h"

namespace base {

std::vector<std::string> ArgumentWords(int, char**) {
    int count = 0;
    const std::unique_ptr<wchar_t*, decltype(&LocalFree)> words(
        CommandLineToArgvW(GetCommandLineW(), &count), LocalFree);
    std::vector<std::string> arguments;
    for (int i = 1; words && i < count; ++i)
        arguments.push_back(Utf8(words.get()[i]));
    return arguments;
}

std::optional<std::string> EnvironmentVariable(const std::string& name) {
    std::wstring text(32768, L'\0');
    SetLastError(ERROR_SUCCESS);
    text.resize(
        GetEnvironmentVariableW(Utf16(name).c_str(), text.data(), static_cast<DWORD>(text.size())));
    if (text.empty() && GetLastError() != ERROR_SUCCESS) return std::nullopt;
    return Utf8(text);
}

std::vector<std::string> EnvironmentVariables() {
    const std::unique_ptr<wchar_t, decltype(&FreeEnvironmentStringsW)> all(GetEnvironmentStringsW(),
                                                                           FreeEnvironmentStringsW);
    std::vector<std::string> variables;
    const wchar_t* next = all.get();
    while (next != nullptr && *next != L'\0') {
        const std::wstring_view variable(next);
        variables.push_back(Utf8(variable));
        next += variable.size() + 1;
    }
    return variables;
}

std::string ConfigurationDirectory() {
    std::string directory = EnvironmentVariable("APPDATA").value_or("");
    std::ranges::replace(directory, '\\', '/');
    return directory;
}

const char* const kNoConfigurationDirectory = "APPDATA isn't set";

std::string ExecutableDirectory() {
    std::wstring file(32768, L'\0');
    file.resize(GetModuleFileNameW(nullptr, file.data(), static_cast<DWORD>(file.size())));
    const std::size_t slash = file.find_last_of(L"\\/");
    return slash == std::wstring::npos ? "./"
                                       : Utf8(std::wstring_view(file).substr(0, slash)) + "/";
}

}  // namespace base
