// Packets that go to a GDB server in all-stop mode while the plug-in streams chunks through one.
// The server's device is nothing but memory and a loader that is done with what it has whenever it
// has run, or never.

#include <array>
#include <atomic>
#include <string>
#include <thread>

#include "bench/Measurements.h"
#include "target/gdb/client/GdbTarget.h"
#include "target/gdb/server/Server.h"

namespace bench {

namespace {

namespace gdb = target::gdb;

constexpr std::uint32_t kRam = 0x20000000;
constexpr std::uint32_t kBlocks = 0x1000;  ///< from there, as all that follows
constexpr std::uint32_t kPending = 0xFFFFFFFF;

class LoaderMemory final : public gdb::ServedDevice {
  public:
    explicit LoaderMemory(bool finishes) : finishes_(finishes) {}

    std::vector<gdb::MemoryRegion> Regions() const override { return {}; }
    std::string Read(std::uint32_t address, std::size_t size, std::size_t) override {
        return ram_.substr(address - kRam, size);
    }
    void Write(std::uint32_t address, std::string_view bytes, std::size_t) override {
        ram_.replace(address - kRam, bytes.size(), bytes);
    }
    void EraseFlash(std::uint32_t, std::uint32_t) override {}
    void ProgramFlash(std::uint32_t, std::string_view) override {}
    gdb::CoreRegisters& Registers() override { return registers_; }
    void Start() override {
        if (finishes_) ram_.replace(kBlocks, 32, 32, '\0');
    }
    void Stop() override {}
    bool IsRunning() const override { return false; }
    void Reset() override {}
    void ClientGone() override {}

  private:
    const bool finishes_;
    std::string ram_ = std::string(0x2000, '\0');
    gdb::CoreRegisters registers_;
};

/// Hands chunks over as the plug-in does, looks so often while one is pending, and tells how many
/// packets that took.
double PacketsFor(bool finishes, std::uint32_t chunks, std::uint32_t looks) {
    LoaderMemory device(finishes);
    std::atomic<bool> done = false;
    gdb::Server server(
        device, gdb::Address::Parse("127.0.0.1:0"), [&] { return done.load(); },
        [](const std::string&) {});
    std::thread thread([&] { server.Run(); });
    std::uint64_t packets = 0;
    {
        gdb::GdbTarget client({"127.0.0.1", std::to_string(server.Port())}, {},
                              {kRam + kBlocks, 32, kPending}, {}, {});
        client.Run();
        const std::string bytes(2048, 'x');
        const std::array<std::uint32_t, 3> parameters = {0, 2048, kPending};
        const std::uint64_t before = client.PacketCount();
        for (std::uint32_t i = 0; i < chunks; ++i) {
            client.Write(bytes.data(), bytes.size(), kRam + i % 2 * 2048, 1, 1);
            client.Write(parameters.data(), 12, kRam + kBlocks + i % 2 * 16 + 4, 1, 1);
            std::uint32_t status = kPending;
            for (std::uint32_t look = 0; status == kPending && look < looks; ++look)
                client.Read(&status, 1, kRam + kBlocks + (i + 1) % 2 * 16 + 12, 1, 4);
        }
        packets = client.PacketCount() - before;
    }
    done = true;
    thread.join();
    return static_cast<double>(packets);
}

}  // namespace

Table PacketsTable() {
    Table table("packets", "Packets to a GDB server that must stop the target for each look",
                {"for each", "packets"});
    const double all = PacketsFor(true, 300, 2) - PacketsFor(true, 100, 2);
    table.Add({"chunk of 2048 bytes, done at the first look", all / 200});
    const double inVain = PacketsFor(false, 2, 110) - PacketsFor(false, 2, 10);
    table.Add({"look at a chunk that is pending", inVain / 100});
    return table;
}

}  // namespace bench
