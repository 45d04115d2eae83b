// Characters to edges and levels.

#include "tests/probe/Wire.h"

#include "target/Target.h"

namespace probe {

std::uint32_t Cable::Read(std::uint32_t address, unsigned width) {
    Pass(address);
    return bus_.Read(address, width);
}

void Cable::Write(std::uint32_t address, std::uint32_t value, unsigned width) {
    Pass(address);
    bus_.Write(address, value, width);
}

void Cable::Pass(std::uint32_t address) {
    if (address == fault_.address && fault_.accesses != 0) off_ = --fault_.accesses == 0;
    if (off_) throw target::TargetError("the cable is off");
}

std::optional<std::string> Wire::Take(std::string_view characters) {
    std::string levels;
    for (const char character : characters) {
        if (character >= '0' && character <= '7') SetPins(static_cast<unsigned>(character - '0'));
        if (character == 'R') levels += cable_.IsOff() || port_.Tdo() ? '1' : '0';
        if (character == 't' || character == 'u') port_.Reset();
        if (character == 'Q') return std::nullopt;
    }
    return levels;
}

void Wire::SetPins(unsigned pins) {
    const bool clock = (pins & 4) != 0;
    const bool rises = clock && !clock_;
    clock_ = clock;
    if (rises && !cable_.IsOff()) port_.Clock((pins & 2) != 0, (pins & 1) != 0);
}

}  // namespace probe
