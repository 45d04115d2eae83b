// A pretend microcontroller, just good enough for all that the plug-in does to one. A real host has
// its debug probe here.

#pragma once

#include <chrono>
#include <cstdint>
#include <cstring>
#include <map>
#include <vector>

constexpr std::uint32_t RamStart = 0x20000000;
constexpr std::uint32_t FlashAddress = 0x400FD000;
constexpr std::uint32_t FlashCommand = 0x400FD008;
constexpr std::uint32_t EraseSector = 0xA4420002;  // commands have the key in their upper half
constexpr std::uint32_t EraseAll = 0xA4420004;
constexpr std::uint32_t Commit = 0xA4420008;
constexpr std::uint32_t UserRegisters = 0x400FE1E0;  // two words
constexpr std::uint32_t SectorSize = 1024;
constexpr int ChunkMs = 120;

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
        CarryOutCommand();
        if (running_) ServeLoader();
        return true;
    }

    void Run() { running_ = true; }
    // The loader doesn't go on with what it was doing.
    void Halt() { running_ = working_[0] = working_[1] = false; }
    // Leaves the target halted. The user registers lose what was not committed.
    void Reset() {
        Halt();
        registers_[FlashAddress] = 0;
        for (std::uint32_t i : {0u, 1u})
            registers_[UserRegisters + 4 * i] = committed_[i];
    }

  private:
    // Flash from 0, RAM from 0x20000000; every other word address is a register.
    void* At(std::uint32_t address, std::size_t bytes) {
        if (address < flash_.size() && bytes <= flash_.size() - address)
            return flash_.data() + address;
        const std::uint32_t offset = address - RamStart;
        if (offset < ram_.size() && bytes <= ram_.size() - offset) return ram_.data() + offset;
        return bytes == 4 ? &registers_[address] : nullptr;
    }

    // A command is done at once. One without the key does nothing.
    void CarryOutCommand() {
        const std::uint32_t address = registers_[FlashAddress];
        switch (registers_[FlashCommand]) {
            case EraseSector:
                if (address < flash_.size())
                    std::memset(&flash_[address / SectorSize * SectorSize], 0xFF, SectorSize);
                break;
            case EraseAll:
                std::memset(flash_.data(), 0xFF, flash_.size());
                break;
            case Commit:
                committed_[address & 1] = registers_[UserRegisters + 4 * (address & 1)];
                break;
            default:
                return;
        }
        registers_[FlashCommand] = 0;
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
        {UserRegisters, 0xFFFFFFFF},
        {UserRegisters + 4, 0xFFFFFFFF},
    };
    std::uint32_t committed_[2] = {0xFFFFFFFF, 0xFFFFFFFF};
    bool running_ = false;
    bool working_[2] = {};  // on the chunk of that block, since:
    std::chrono::steady_clock::time_point begun_[2];
};
