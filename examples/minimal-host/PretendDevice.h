// A pretend microcontroller, just good enough for the plug-in to identify, erase and program it.
// A real host has its debug probe here.

#pragma once

#include <chrono>
#include <cstdint>
#include <cstring>
#include <map>
#include <vector>

class PretendDevice {
  public:
    // Both move `bytes` bytes and return whether there is anything at that address.
    bool Read(void* buffer, std::uint32_t address, std::size_t bytes) {
        if (running_) ServeLoader();
        void* memory = At(address, bytes);
        if (memory != nullptr) std::memcpy(buffer, memory, bytes);
        return memory != nullptr;
    }

    bool Write(const void* buffer, std::uint32_t address, std::size_t bytes) {
        void* memory = At(address, bytes);
        if (memory == nullptr || address < flash_.size()) return false;
        std::memcpy(memory, buffer, bytes);
        EraseIfCommanded();
        if (running_) ServeLoader();
        return true;
    }

    void Run() { running_ = true; }
    // The loader doesn't go on with what it was doing.
    void Halt() { running_ = working_[0] = working_[1] = false; }

  private:
    static constexpr std::uint32_t RamStart = 0x20000000;
    static constexpr std::uint32_t FlashAddress = 0x400FD000;
    static constexpr std::uint32_t FlashCommand = 0x400FD008;
    static constexpr std::uint32_t SectorErase = 0xA4420002;
    static constexpr std::uint32_t SectorSize = 1024;
    static constexpr int ChunkMs = 120;

    // Flash from 0, RAM from 0x20000000; every other word address is a register.
    void* At(std::uint32_t address, std::size_t bytes) {
        if (address < flash_.size() && bytes <= flash_.size() - address)
            return flash_.data() + address;
        const std::uint32_t offset = address - RamStart;
        if (offset < ram_.size() && bytes <= ram_.size() - offset) return ram_.data() + offset;
        return bytes == 4 ? &registers_[address] : nullptr;
    }

    void EraseIfCommanded() {
        if (registers_[FlashCommand] != SectorErase) return;
        const std::uint32_t start = registers_[FlashAddress];
        if (start < flash_.size()) std::memset(flash_.data() + start, 0xFF, SectorSize);
        registers_[FlashCommand] = 0;  // done at once
    }

    // What FlashLoaderMerrow.out does on a real target: program the chunk of each block whose
    // status says "to do", which takes its time, then say that it is done.
    void ServeLoader() {
        const auto now = std::chrono::steady_clock::now();
        for (std::uint32_t block : {0u, 1u}) {
            std::uint32_t fields[4];  // reserved, flash address, byte count, status
            unsigned char* parameters = ram_.data() + 0x1000 + block * sizeof fields;
            std::memcpy(fields, parameters, sizeof fields);
            if (fields[3] != 0xFFFFFFFF) continue;
            if (!working_[block]) begun_[block] = now;
            working_[block] = now - begun_[block] < std::chrono::milliseconds(ChunkMs);
            if (working_[block]) continue;
            for (std::uint32_t i = 0; i < fields[2] && fields[1] + i < flash_.size(); ++i)
                flash_[fields[1] + i] &= ram_[block * 0x800 + i];  // only an erase sets bits
            std::memset(parameters + 12, 0, 4);
        }
    }

    std::vector<unsigned char> flash_ = std::vector<unsigned char>(64 * 1024, 0xFF);
    std::vector<unsigned char> ram_ = std::vector<unsigned char>(16 * 1024);
    std::map<std::uint32_t, std::uint32_t> registers_ = {
        {0x400FE000, 0x000A0000},  // identification: class field 10, Dorna
        {0x400FDFC0, 31},          // flash: (31 + 1) * 2 KiB, in sectors of 1 KiB
        {0x400FDFC4, 63},          // RAM: (63 + 1) * 256 bytes
    };
    bool running_ = false;
    bool working_[2] = {};  // on the chunk of that block, since:
    std::chrono::steady_clock::time_point begun_[2];
};
