// Reading tags from the front of what is left of the document.

#include "target/gdb/client/XmlElements.h"

#include <fmt/format.h>

#include <algorithm>

namespace target::gdb {

namespace {

constexpr std::string_view kSpaces = " \t\r\n";
constexpr std::string_view kNameEnds = " \t\r\n<>/='\"&!?[]";

}  // namespace

std::optional<std::string_view> XmlElement::Attribute(std::string_view wanted) const {
    for (const auto& [attribute, value] : attributes)
        if (attribute == wanted) return value;
    return std::nullopt;
}

std::optional<XmlElement> XmlElements::Next() {
    for (;;) {
        rest_.remove_prefix(std::min(rest_.find('<'), rest_.size()));
        if (rest_.empty()) {
            if (!open_.empty()) FailExpected(fmt::format("</{}>", open_.back()));
            if (!found_) FailExpected("an element");
            return std::nullopt;
        }
        if (Take("<!--"))
            TakeUntil("-->");
        else if (Take("<![CDATA["))
            TakeUntil("]]>");
        else if (Take("<?"))
            TakeUntil("?>");
        else if (Take("<!DOCTYPE"))
            PassDocumentType();
        else if (Take("</"))
            End();
        else
            return Begin();
    }
}

void XmlElements::FailExpected(const std::string& what) const {
    const std::string_view read = document_.substr(0, document_.size() - rest_.size());
    const auto line = std::count(read.begin(), read.end(), '\n') + 1;
    throw XmlError(fmt::format("{} expected in line {}", what, line));
}

bool XmlElements::Take(std::string_view text) {
    if (!rest_.starts_with(text)) return false;
    rest_.remove_prefix(text.size());
    return true;
}

bool XmlElements::TakeSpaces() {
    const std::size_t count = std::min(rest_.find_first_not_of(kSpaces), rest_.size());
    rest_.remove_prefix(count);
    return count != 0;
}

std::string_view XmlElements::TakeUntil(std::string_view end) {
    const std::size_t size = rest_.find(end);
    if (size == std::string_view::npos) FailExpected(std::string(end));
    const std::string_view taken = rest_.substr(0, size);
    rest_.remove_prefix(size + end.size());
    return taken;
}

std::string_view XmlElements::TakeName() {
    const std::string_view name = rest_.substr(0, rest_.find_first_of(kNameEnds));
    if (name.empty()) FailExpected("a name");
    rest_.remove_prefix(name.size());
    return name;
}

std::string_view XmlElements::TakeValue() {
    if (Take("\"")) return TakeUntil("\"");
    if (Take("'")) return TakeUntil("'");
    FailExpected("a value in quotes");
}

// It may have declarations of its own in brackets, and quoted texts.
void XmlElements::PassDocumentType() {
    for (int brackets = 0;;) {
        rest_.remove_prefix(std::min(rest_.find_first_of("'\"[]>"), rest_.size()));
        if (rest_.empty()) FailExpected(">");
        if (rest_.front() == '"' || rest_.front() == '\'') {
            TakeValue();
            continue;
        }
        if (Take("["))
            ++brackets;
        else if (Take("]"))
            --brackets;
        else if (Take(">") && brackets <= 0)
            return;
    }
}

XmlElement XmlElements::Begin() {
    rest_.remove_prefix(1);
    found_ = true;
    XmlElement element{TakeName(), {}};
    for (;;) {
        const bool separated = TakeSpaces();
        if (Take("/>")) return element;
        if (Take(">")) {
            open_.push_back(element.name);
            return element;
        }
        if (!separated) FailExpected(">");
        const std::string_view attribute = TakeName();
        TakeSpaces();
        if (!Take("=")) FailExpected("=");
        TakeSpaces();
        element.attributes.emplace_back(attribute, TakeValue());
    }
}

void XmlElements::End() {
    const std::string_view name = TakeName();
    TakeSpaces();
    if (open_.empty() || open_.back() != name)
        FailExpected(open_.empty() ? "no end tag" : fmt::format("</{}>", open_.back()));
    if (!Take(">")) FailExpected(">");
    open_.pop_back();
}

}  // namespace target::gdb
