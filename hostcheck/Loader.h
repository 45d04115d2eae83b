// The flash loader from the host's side: how it is loaded, given chunks and waited for. The chunks
// are of 0xFF, which clear no bit of the flash.

#pragma once

#include <cstdint>
#include <string>

#include "device/RegisterMap.h"
#include "hostcheck/CheckedHost.h"

namespace hostcheck {

constexpr std::uint32_t LoaderBuffer(unsigned block) {
    return LoaderMemory::Buffers + block * LoaderMemory::BufferSize;
}

constexpr std::uint32_t LoaderParameters(unsigned block) {
    return LoaderMemory::ParameterBlocks + block * LoaderMemory::ParameterBlockSize +
           LoaderMemory::ChunkOffset;
}

constexpr std::uint32_t LoaderStatus(unsigned block) {
    return LoaderMemory::ParameterBlocks + block * LoaderMemory::ParameterBlockSize +
           LoaderMemory::StatusOffset;
}

/// The directory of target-side programs. Breach when there is none.
std::string LoaderDirectory(const CheckedHost& host);

/// Leaves "to do" in both status words, as RAM may hold it from the last load, and loads the
/// loader. Breach when that fails.
void LoadLoader(CheckedHost& host);

/// Reads both status words, and writes 0 where "to do" is left, so that the loader can be started.
/// Returns what was in them. Breach when "to do" was left, or can't be ruled out.
std::string ClearStatusWords(CheckedHost& host);

/// NotChecked unless the loader has been loaded and its status words cleared.
void RequireStartable(const CheckedHost& host);

/// Starts the loader, which has to be startable.
void StartLoader(CheckedHost& host);

/// All of that for one more start.
void RestartLoader(CheckedHost& host);

/// Whether the block's status is "to do".
bool IsPending(const CheckedHost& host, unsigned block);

/// Writes a chunk into the block whose turn it is, whose turn is over then. Returns the block.
unsigned HandOver(CheckedHost& host);

/// Looks every 100 ms, as the plug-in does. Breach when the block is still pending after the time
/// that the host allows.
void AwaitChunk(const CheckedHost& host, unsigned block);

/// Breach when a chunk that is handed over now is taken all the same. It is taken back.
void RequireNothingRuns(CheckedHost& host);

/// Leaves no "to do" behind, so far as the host can.
void ForgetChunks(const CheckedHost& host);

}  // namespace hostcheck
