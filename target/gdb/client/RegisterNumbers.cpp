// Following includes, and counting registers that have no number.

#include "target/gdb/client/RegisterNumbers.h"

#include <fmt/format.h>

#include <algorithm>
#include <pugixml.hpp>
#include <string_view>

namespace target::gdb {

namespace {

constexpr int kDocumentsMax = 64;
constexpr int kDepthMax = 8;

class Reader {
  public:
    explicit Reader(const FetchDocument& fetch) : fetch_(fetch) {}

    void ReadDocument(const std::string& name, int depth) {
        if (++documents_ > kDocumentsMax || depth > kDepthMax)
            throw DescriptionError("the target description includes documents without end");
        pugi::xml_document document;
        const auto result = document.load_string(fetch_(name).c_str());
        if (!result)
            throw DescriptionError(fmt::format("the target description's document {} is no XML: {}",
                                               name, result.description()));
        Visit(document, depth, 0);
    }

    RegisterNumbers numbers;

  private:
    void Visit(const pugi::xml_node& parent, int depth, int nesting) {
        if (nesting > kDepthMax) return;
        for (const pugi::xml_node& node : parent.children()) {
            const std::string_view name = node.name();
            if (name == "xi:include")
                ReadDocument(node.attribute("href").as_string(), depth + 1);
            else if (name == "reg")
                Add(node);
            else
                Visit(node, depth, nesting + 1);
        }
    }

    void Add(const pugi::xml_node& node) {
        next_ = node.attribute("regnum").as_uint(next_);
        std::string name = node.attribute("name").as_string();
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
