// Whole use across the binary boundary. The first byte says how many of the following ones are
// calls into the plug-in; the rest are the host's answers.

#include <cstring>
#include <vector>

#include "fuzz/FuzzHost.h"
#include "plugin/IFlashDevice2.h"

namespace {

constexpr std::uint32_t kRegisters[] = {0x400FE000, 0x400FE008, 0x400FDFC0, 0x400FDFC4, 0x400FE1D0,
                                        0x400FE1A0, 0x400FE400, 0x400FD008, 0x2000100C, 0x2000101C};

constexpr const char* kOperations[] = {
    "Erase",          "BlankCheck",           "CalculateChecksum",   "ProgramUserRegister0",
    "ReadMACAddress", "ProgramUserRegister1", "ReadUserRegister0",   "ReadUserRegister1",
    "Test",           "ProgramMACAddress",    "no such operation %n"};

// The calls of one input, made on one device object after another.
class Caller {
  public:
    Caller(FuzzHost& host, ByteSource calls) : host_(host), calls_(calls) {
        for (const std::uint32_t address : {kRegisters[0], kRegisters[1], kRegisters[2]})
            host_.registers[address] = calls_.Word();
        Create();
    }
    ~Caller() { Destroy(); }
    Caller(const Caller&) = delete;
    Caller& operator=(const Caller&) = delete;

    void Run() {
        while (device_ != nullptr && !calls_.Empty())
            MakeCall();
    }

    // With an ordinary host, whatever has happened before is forgotten.
    void RequireUsable() {
        host_.BecomeOrdinary();
        if (device_ == nullptr) Create();
        Require(device_ != nullptr, "a device object can be created");
        Require(Returned(device_->ResetSettings(0)), "a load can be started");
        Require(Returned(device_->PerformOperation("Test")), "an operation can be run");
        Require(host_.errorsShown == 0, "an operation succeeds");
    }

  private:
    void Create() {
        IFlashDevice2* device = nullptr;
        const char* error = test::Factory()("variant", "", nullptr, &host_, &device);
        host_.CallReturned();
        Require((error == nullptr) == (device != nullptr), "creation gives an object or a text");
        if (error != nullptr) RequireText(error);
        device_ = device;
    }

    void Destroy() {
        errorPointer_ = nullptr;
        if (device_ != nullptr) device_->Destroy();
        device_ = nullptr;
    }

    // An error text stays readable and unchanged until the next failing call. True for success.
    bool Returned(const char* error) {
        host_.CallReturned();
        if (error != nullptr) {
            errorPointer_ = error;
            errorText_ = error;
        }
        Require(errorPointer_ == nullptr || errorText_ == errorPointer_, "an error text is kept");
        return error == nullptr;
    }

    std::uint64_t Address() {
        const std::uint64_t address = calls_.Word();
        return address >> 24 == 0x7F ? address << 8 : address;  // some beyond 32 bits
    }

    template <typename Query>
    void Ask(Query query) {
        alignas(bool) unsigned char answer = 0x55;
        const bool done = Returned(query(reinterpret_cast<bool*>(&answer)));
        Require(done ? answer <= 1 : answer == 0x55, "an output is written by success alone");
    }

    void Write() {
        const std::uint64_t address = Address();
        const std::vector<unsigned char> data(calls_.Word() % 10000);
        const auto page = static_cast<std::int16_t>(calls_.Byte());
        Returned(device_->WriteDataToFlash(data.data(), address,
                                           static_cast<std::uint32_t>(data.size()), page));
    }

    void Initialize() {
        const char* operations = nullptr;
        Ask([&](bool* available) { return device_->Initialize(available, &operations); });
        Require(operations == nullptr || std::strlen(operations) > 0, "the operations are listed");
    }

    void Perform() {
        const std::uint8_t index = calls_.Byte();
        const std::string text = calls_.Text();
        const bool known = index < std::size(kOperations);
        Returned(device_->PerformOperation(known ? kOperations[index] : text.c_str()));
    }

    void ChangeSetting() {
        auto setting = host_.settings.begin();
        std::advance(setting, calls_.Byte() % host_.settings.size());
        setting->second = calls_.Text();
    }

    void MakeCall() {
        switch (calls_.Byte() % 12) {
            case 0:
                return Initialize();
            case 1:
                return Ask([&](bool* in) { return device_->AddressWithinFlash(Address(), in); });
            case 2: {
                const auto size = static_cast<std::int32_t>(calls_.Word());
                return Ask(
                    [&](bool* in) { return device_->AddressWithinFlash(Address(), size, in); });
            }
            case 3: {
                const std::uint16_t* nowhere = nullptr;
                Require(!Returned(device_->WriteDataToFlash(nowhere, Address(), 4, 0)),
                        "16-bit data is refused");
                return;
            }
            case 4:
            case 5:
                return Write();
            case 6:
                return Perform();
            case 7:
                Returned(device_->ResetSettings(static_cast<std::int8_t>(calls_.Byte())));
                return;
            case 8:
                return Ask(
                    [&](bool* in) { return device_->AddressWithinSpecialRegion(Address(), in); });
            case 9:
                Destroy();
                return Create();
            case 10:
                return ChangeSetting();
            default:
                const std::uint32_t address = kRegisters[calls_.Byte() % std::size(kRegisters)];
                host_.registers[address] = calls_.Word();
        }
    }

    FuzzHost& host_;
    ByteSource calls_;
    IFlashDevice2* device_ = nullptr;
    const char* errorPointer_ = nullptr;
    std::string errorText_;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    ByteSource input(data, data + size);
    const ByteSource calls = input.Split(input.Byte());
    FuzzHost host(input);
    Caller caller(host, calls);
    caller.Run();
    caller.RequireUsable();
    return 0;
}
