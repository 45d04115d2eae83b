// The loader's life: start, take a chunk, program it, report it, take the next; or be stopped.

#include "target/simulated/Loader.h"

#include <fmt/format.h>

namespace target {

namespace {

// The status word says whose a block is. Handed over: the loader's, until it writes another value;
// any other value: the debugger's. Nobody but the loader takes back what was handed over, so a
// loader that is gone leaves it so for ever.

constexpr std::uint32_t kBufferSizeBytes = Loader::kChunkMax;
constexpr std::uint32_t kParameterSizeBytes = 16;
constexpr std::uint32_t kBlockSizeBytes = 128;

constexpr std::uint32_t kStatusIdle = 0;
constexpr std::uint32_t kStatusBadParameters = 1;
constexpr std::uint32_t kStatusHandedOver = 0xFFFFFFFF;

constexpr std::uint32_t Buffer(std::uint32_t block) {
    return Ram::kStart + block * kBufferSizeBytes;
}

constexpr std::uint32_t Parameters(std::uint32_t block) {
    return Ram::kStart + 2 * kBufferSizeBytes + block * kParameterSizeBytes;
}

constexpr std::uint32_t FlashAddress(std::uint32_t block) {
    return Parameters(block) + 4;
}
constexpr std::uint32_t ByteCount(std::uint32_t block) {
    return Parameters(block) + 8;
}
constexpr std::uint32_t Status(std::uint32_t block) {
    return Parameters(block) + 12;
}

bool Overlap(std::uint64_t startA, std::uint64_t sizeA, std::uint64_t startB, std::uint64_t sizeB) {
    return startA < startB + sizeB && startB < startA + sizeA;
}

}  // namespace

Loader::Loader(const DeviceOptions& options, Ram& ram, FlashArray& flash,
               FlashController& controller, RuleLog& rules)
    : options_(options), ram_(ram), flash_(flash), controller_(controller), rules_(rules) {}

// Whatever the words held is gone, so a chunk that was handed over before the start is lost.
void Loader::Start() {
    Forget();
    if (options_.faults.loader == LoaderFault::Dead) return;
    running_ = true;
    block_ = 0;
    ram_.SetWord(Status(0), kStatusIdle);
    ram_.SetWord(Status(1), kStatusIdle);
}

void Loader::Stop() {
    if (!running_) return;
    // From here on the end of a chunk is what it still needs; Continue makes it a time again.
    if (chunk_) {
        ProgramFromBuffer(chunk_->sizeBytes / 2);
        chunk_->end -= now_;
    }
    halted_ = true;
    running_ = false;
}

void Loader::Continue(Time now) {
    if (!halted_) return;
    if (chunk_) chunk_->end += now;
    halted_ = false;
    running_ = true;
}

void Loader::Forget() {
    Stop();
    halted_ = false;
    chunk_.reset();
}

void Loader::AdvanceTo(Time now) {
    now_ = now;
    if (!running_ || options_.faults.loader == LoaderFault::Hangs) return;
    // The debugger's write is followed by an AdvanceTo, so a chunk that is found while the loader
    // idles was handed over just now; one found behind another chunk starts when that one ends.
    Time start = now;
    for (;;) {
        if (chunk_) {
            if (chunk_->end > now) return;
            start = chunk_->end;
            FinishChunk();
        }
        if (!StartChunk(start)) return;
    }
}

// False when there is nothing to do, or when the loader waits for the flash controller.
bool Loader::StartChunk(Time start) {
    // Strictly in turn: a chunk in the other block waits until this one has been served.
    if (ram_.Word(Status(block_)) != kStatusHandedOver || controller_.IsBusy()) return false;
    const std::uint32_t address = ram_.Word(FlashAddress(block_));
    const std::uint32_t size = ram_.Word(ByteCount(block_));
    if (address % kBlockSizeBytes != 0 || size % kBlockSizeBytes != 0 || size == 0 ||
        size > kBufferSizeBytes || !flash_.Contains(address, size)) {
        rules_.Record(rule::kLoaderParameters,
                      fmt::format("The loader was given {} bytes for {:#x}: it takes 128 to 2048 "
                                  "bytes in whole 128-byte blocks inside the 0x{:X}-byte flash",
                                  size, address, flash_.SizeBytes()));
        ram_.SetWord(Status(block_), kStatusBadParameters);
        block_ ^= 1;
        return true;
    }
    chunk_ = Chunk{address, size, start + options_.timings.chunk, IsLost(address, size, start)};
    return true;
}

// The loader can't tell: it reports such a chunk like any other.
bool Loader::IsLost(std::uint32_t address, std::uint32_t sizeBytes, Time start) {
    const auto obstacle = controller_.PrepareToProgram(address, sizeBytes, start);
    if (!obstacle) return false;
    rules_.Record(obstacle->rule, fmt::format("The loader programmed nothing at {:#x}: {}", address,
                                              obstacle->why));
    return true;
}

// Programs the whole chunk, the half of it again that a halt may have cut short: the same bits are
// cleared twice, which changes nothing.
void Loader::FinishChunk() {
    ProgramFromBuffer(chunk_->sizeBytes);
    busyTime_ += options_.timings.chunk;
    ram_.SetWord(Status(block_), kStatusIdle);
    block_ ^= 1;
    chunk_.reset();
}

void Loader::ProgramFromBuffer(std::uint32_t sizeBytes) {
    if (chunk_->lost) return;
    const auto notErased =
        flash_.Program(chunk_->flashAddress, ram_.Bytes(Buffer(block_), sizeBytes));
    if (notErased) {
        rules_.Record(rule::kErasedCells,
                      fmt::format("The loader programmed {:#x}, where bits that had to become 1 "
                                  "were not erased",
                                  *notErased));
    }
}

// A loader that was halted owns nothing: whoever halted it may do as they like.
bool Loader::Owns(std::uint32_t address, std::uint64_t sizeBytes) {
    if (!running_) return false;
    for (std::uint32_t block = 0; block < 2; ++block) {
        if (ram_.Word(Status(block)) != kStatusHandedOver) continue;
        if (Overlap(address, sizeBytes, Buffer(block), kBufferSizeBytes) ||
            Overlap(address, sizeBytes, Parameters(block), kParameterSizeBytes)) {
            return true;
        }
    }
    return false;
}

}  // namespace target
