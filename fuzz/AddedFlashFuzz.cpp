// A debugger that asks what it likes of a probe with flash added, and a probe whose answers come to
// harm. Each line of the input is a packet of the debugger's, or, behind a '!', its bytes as they
// stand. Lines "~COUNTx" are about the probe's answers, in their order: after COUNT good ones, one
// is dropped (d), refused (e), damaged (x), doubled (2), cut with the connection (c), or is the
// text behind a '='.
//
// It ends in time, and what the debugger was told is true: when it hears that the flash is done,
// the flash holds what it was allowed to write. (Not so behind a probe that invents its answers, or
// when the debugger writes to the flash's registers itself.)

#include <dlfcn.h>

#include <charconv>
#include <cstdint>
#include <deque>
#include <map>
#include <string>
#include <string_view>

#include "fuzz/Require.h"
#include "target/gdb/server/Arguments.h"
#include "tests/gdb/Debugger.h"

namespace {

using namespace target;
using namespace target::gdb;

constexpr std::uint32_t kFlashBytes = 0x10000;
constexpr std::size_t kRequestsMax = 40;

struct Harm {
    std::size_t goodOnes = 0;
    char kind = 0;
    std::string text;
};

struct Script {
    std::vector<std::string> debugger;
    std::deque<Harm> probe;
};

Script Parse(std::string_view input) {
    Script script;
    while (!input.empty()) {
        const std::size_t end = std::min(input.find('\n'), input.size());
        const std::string_view line = input.substr(0, end);
        input.remove_prefix(std::min(end + 1, input.size()));
        if (!line.starts_with('~')) {
            if (script.debugger.size() < kRequestsMax) script.debugger.emplace_back(line);
            continue;
        }
        Harm harm;
        const char* const last = line.data() + line.size();
        const char* const rest = std::from_chars(line.data() + 1, last, harm.goodOnes).ptr;
        if (rest == last) continue;
        harm.kind = *rest;
        harm.text = std::string(rest + 1, last);
        script.probe.push_back(harm);
    }
    return script;
}

/// A letter that no fault has bends nothing.
void Bend(std::deque<Harm>& harms, std::string& late, std::string& wire) {
    wire.insert(0, std::exchange(late, ""));
    if (harms.empty() || harms.front().goodOnes-- > 0) return;
    const Harm harm = std::move(harms.front());
    harms.pop_front();
    if (harm.kind == '=') wire = "+" + Framed(harm.text);
    for (const test::ReplyFault& fault : test::kReplyFaults)
        if (fault.letter == harm.kind && fault.bend != nullptr) fault.bend(wire, late);
}

/// What the debugger was allowed to write, by what it was answered.
class Promise {
  public:
    void Take(std::string_view request, const std::optional<std::string>& answer,
              const SimulatedDevice& device) {
        if (!request.starts_with("vFlash")) return;
        const bool allowed = answer == "OK";
        Arguments at;
        const std::string_view rest = request.substr(std::min(request.find(':'), request.size()));
        if (!allowed) return bytes_.clear();
        if (request == "vFlashDone") {
            const auto held = device.FlashContents();
            for (const auto& [address, byte] : bytes_)
                Require(held[address] == byte, "what is said to be done is done");
            bytes_.clear();
        } else if (request.starts_with("vFlashErase:") && Range(rest.substr(1), at)) {
            Require(at.address + std::uint64_t{at.length} <= kFlashBytes, "only flash is erased");
            for (std::uint32_t i = 0; i < at.length; ++i)
                bytes_[at.address + i] = 0xFF;
        } else if (request.starts_with("vFlashWrite:") && FlashBytes(rest.substr(1), at)) {
            for (std::size_t i = 0; i < at.data.size(); ++i)
                bytes_[at.address + static_cast<std::uint32_t>(i)] =
                    static_cast<std::uint8_t>(at.data[i]);
        } else {
            Require(false, "only what can be read is allowed");
        }
    }

  private:
    std::map<std::uint32_t, std::uint8_t> bytes_;
};

bool Harmless(const Script& script) {
    const auto invents = [](const Harm& harm) { return harm.kind == '='; };
    const auto asks = [](const std::string& request) {
        return request.starts_with("vFlash") || request.starts_with("m") || request == "?" ||
               request.starts_with("qSupported") || request.starts_with("qXfer") ||
               request.starts_with("qCRC");
    };
    return std::ranges::none_of(script.probe, invents) &&
           std::ranges::all_of(script.debugger, asks);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    // Unloaded, it would take its coverage with it.
    [[maybe_unused]] static void* const keptLoaded = dlopen(FLASH_CORVANE_LIBRARY, RTLD_NOW);
    Script script = Parse({reinterpret_cast<const char*>(data), size});
    const bool harmless = Harmless(script);
    std::string late;
    test::Peer peer([](const std::string&) { return std::nullopt; },
                    [&](const std::string&, std::string& wire) { Bend(script.probe, late, wire); },
                    std::make_unique<SimulatedDevice>(ParseDeviceOptions(
                        "quen,flash=64K,latency=1ns,bandwidth=0,erase-time=1us")));
    test::Debugger debugger(peer);
    debugger.patience = std::chrono::milliseconds(200);
    Promise promise;
    for (const std::string& line : script.debugger) {
        const auto answer =
            line.starts_with('!') ? debugger.Say(line.substr(1)) : debugger.Ask(line);
        if (!answer) break;
        if (harmless) promise.Take(line, answer, peer.Device());
    }
    debugger.Leave();
    peer.Log();
    return 0;
}
