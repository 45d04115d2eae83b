// Whether the loader can be had, the target reset, and the loader run in it and be asked.

#include <fmt/format.h>

#include <chrono>

#include "base/Hex.h"
#include "base/system/Environment.h"
#include "host/base/Errors.h"
#include "host/base/Text.h"
#include "host/checks/CheckTable.h"
#include "host/driver/PluginLibrary.h"
#include "host/facts/FlashMemory.h"
#include "host/facts/LoaderMemory.h"

namespace host {

namespace {

/// A loader that has crashed stands in a fault handler, or nowhere.
void RequireInRam(const CheckSubject& subject) {
    const auto pc = subject.opened.ProgramCounter();
    if (pc && *pc - plugin::kLoaderBuffers >= subject.info.ramBytes)
        throw CheckFailed(fmt::format(
            "the loader was started, and the target then stood at {}, outside the RAM: it crashed",
            base::HexText(*pc)));
}

}  // namespace

std::string CheckLoader(CheckSubject& subject) {
    try {
        subject.opened.RequireLoader(base::ExecutableDirectory());
    } catch (const Failure& failure) {
        throw CheckFailed(failure.what());
    }
    subject.loader = subject.opened.LoaderMemory(base::ExecutableDirectory());
    if (subject.loader->empty()) return "the simulated device has its own";
    base::AddressSet used;
    for (const base::AddressRange& range : *subject.loader)
        used.Add(range);
    return fmt::format("fits into the RAM; with buffers and stack it uses {} of {}",
                       SizeText(used.Bytes()), SizeText(subject.info.ramBytes));
}

std::string CheckReset(CheckSubject& subject) {
    subject.Target().Reset(true);
    subject.resets = true;
    return "the target is halted after it";
}

/// The loader waits for its first chunk, and none is handed over.
std::string CheckRun(CheckSubject& subject) {
    if (!subject.loader || !subject.memory || !subject.resets)
        throw CheckNotMade("it needs the loader, the RAM and a reset");
    target::Target& target = subject.Target();
    target.LoadProgram(plugin::kLoaderFile,
                       base::ExecutableDirectory() + plugin::kLoaderSubdirectory);
    target.Run();
    constexpr int kLooks = 5;
    constexpr std::chrono::milliseconds kPause(10);
    for (int i = 0; i < kLooks; ++i) {
        target.Pause(kPause);
        std::uint32_t status = 0;
        for (const std::uint32_t block : plugin::kParameterBlocks)
            target.Read(&status, 1, block + plugin::kStatusOffset, plugin::kRamPage, sizeof status);
    }
    subject.speed.live = !target.StopsForReads();
    target.Halt();
    RequireInRam(subject);
    return fmt::format("the loader runs, and is looked at {}",
                       *subject.speed.live ? "as it runs" : "by stopping it for a moment");
}

std::string PutBack(CheckSubject& subject) {
    target::Target& target = subject.Target();
    target.Halt();
    std::string text;
    if (subject.memory) {
        subject.memory->PutBack();
        text = fmt::format("{} of RAM hold what they held; ", SizeText(subject.memory->Bytes()));
    }
    if (!subject.resets) return text + "the target is halted";
    target.Reset(true);
    return text + "the target is halted at its reset";
}

}  // namespace host
