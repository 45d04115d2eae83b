// Following includes, and counting registers that have no number.

#include "target/gdb/client/RegisterNumbers.h"

#include <fmt/format.h>

#include <algorithm>
#include <charconv>
#include <string_view>

#include "target/gdb/client/Connection.h"
#include "target/gdb/client/XmlElements.h"

namespace target::gdb {

namespace {

constexpr int kDocumentsMax = 64;
constexpr int kDepthMax = 8;

/// In C's notation, as GDB reads it.
unsigned ParseNumber(std::string_view text) {
    const bool hex = text.starts_with("0x") || text.starts_with("0X");
    const std::string_view digits = text.substr(hex ? 2 : 0);
    const char* const end = digits.data() + digits.size();
    unsigned number = 0;
    const auto [rest, error] = std::from_chars(digits.data(), end, number, hex ? 16 : 10);
    if (error != std::errc() || rest != end)
        throw DescriptionError(
            fmt::format("the target description numbers a register '{}'", Shown(text)));
    return number;
}

class Reader {
  public:
    explicit Reader(const FetchDocument& fetch) : fetch_(fetch) {}

    void ReadDocument(const std::string& name, int depth) try {
        if (++documents_ > kDocumentsMax || depth > kDepthMax)
            throw DescriptionError("the target description includes documents without end");
        const std::string document = fetch_(name);
        XmlElements elements(document);
        while (const auto element = elements.Next()) {
            if (element->name == "xi:include")
                ReadDocument(std::string(element->Attribute("href").value_or("")), depth + 1);
            else if (element->name == "reg")
                Add(*element);
        }
    } catch (const XmlError& error) {
        throw DescriptionError(
            fmt::format("the target description's document {} is no XML: {}", name, error.what()));
    }

    RegisterNumbers numbers;

  private:
    void Add(const XmlElement& element) {
        if (const auto number = element.Attribute("regnum")) next_ = ParseNumber(*number);
        std::string name(element.Attribute("name").value_or(""));
        std::ranges::transform(name, name.begin(), [](char letter) {
            return letter >= 'A' && letter <= 'Z' ? static_cast<char>(letter - 'A' + 'a') : letter;
        });
        numbers.emplace(std::move(name), next_++);
    }

    const FetchDocument& fetch_;
    unsigned next_ = 0;
    int documents_ = 0;
};

}  // namespace

RegisterNumbers ReadRegisterNumbers(const FetchDocument& fetch) {
    Reader reader(fetch);
    reader.ReadDocument("target.xml", 0);
    return std::move(reader.numbers);
}

}  // namespace target::gdb
