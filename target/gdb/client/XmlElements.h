// The elements of an XML document, as far as a target description needs them: names and attributes.
// Nesting takes no stack, so a server's document may nest as deep as it likes.

#pragma once

#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace target::gdb {

/// The text says what is expected in which line.
class XmlError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// All views are of the document. Values are as they stand there: no name of a register or of a
/// document has a character that needs an entity.
struct XmlElement {
    std::string_view name;
    std::vector<std::pair<std::string_view, std::string_view>> attributes;

    std::optional<std::string_view> Attribute(std::string_view wanted) const;
};

class XmlElements {
  public:
    explicit XmlElements(std::string_view document) : document_(document), rest_(document) {}

    /// The next element that begins, whatever it is in; nothing when the document has ended as it
    /// must. Texts, comments, instructions and the document type are passed over.
    std::optional<XmlElement> Next();

  private:
    [[noreturn]] void FailExpected(const std::string& what) const;
    bool Take(std::string_view text);
    bool TakeSpaces();
    std::string_view TakeUntil(std::string_view end);
    std::string_view TakeName();
    std::string_view TakeValue();
    void PassDocumentType();
    XmlElement Begin();
    void End();

    const std::string_view document_;
    std::string_view rest_;
    std::vector<std::string_view> open_;  ///< names of the elements that haven't ended
    bool found_ = false;                  ///< there was an element
};

}  // namespace target::gdb
