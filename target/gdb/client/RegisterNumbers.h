// What a server tells about its target's registers, in XML documents: under which number it knows
// the register of a name.

#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <stdexcept>
#include <string>

namespace target::gdb {

/// Register numbers by name, in lower case: servers write "xpsr" and "xPSR".
using RegisterNumbers = std::map<std::string, unsigned>;

/// Fetches the document of a name, or throws.
using FetchDocument = std::function<std::string(const std::string& name)>;

class DescriptionError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// Reads "target.xml" and the documents that it includes. A register without a number has the one
/// behind its predecessor's. DescriptionError for what can't be read, or includes without end.
RegisterNumbers ReadRegisterNumbers(const FetchDocument& fetch);

}  // namespace target::gdb
