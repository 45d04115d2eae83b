// The object behind IFlashDevice2: owns the device, narrows addresses, and turns exceptions into
// error texts. It catches what derives from std::exception; the device throws nothing else.

#pragma once

#include <cstdint>
#include <exception>
#include <stdexcept>
#include <string>
#include <type_traits>

#include "plugin/ErrorText.h"
#include "plugin/IFlashDevice2.h"

class IFlashHost;

namespace Detail {

/// Converts the host's 64-bit addresses to the device's. Throws for one that does not fit.
template <typename Address>
struct DefaultConverter {
    static Address Convert(std::uint64_t address) {
        const auto converted = static_cast<Address>(address);
        if (converted != address) throw std::runtime_error("Address value is too big");
        return converted;
    }
};

inline std::string OwnedText(const char* text) {
    return text == nullptr ? std::string() : std::string(text);
}

}  // namespace Detail

/// Converter: the address conversion. Device: the device class, built from three texts and the
/// host. DataType: the data unit of the target; the other unit of the interface is refused.
template <typename Converter, typename Device, typename DataType>
class ExceptionSafeFlashDevice : public virtual IFlashDevice2 {
    using OtherDataType =
        std::conditional_t<std::is_same_v<DataType, unsigned char>, std::uint16_t, unsigned char>;

  public:
    ExceptionSafeFlashDevice(const char* variant, const char* text2, const char* text3,
                             IFlashHost* host)
        : device(Detail::OwnedText(variant), Detail::OwnedText(text2), Detail::OwnedText(text3),
                 host) {}
    virtual ~ExceptionSafeFlashDevice() = default;
    ExceptionSafeFlashDevice(const ExceptionSafeFlashDevice&) = delete;
    ExceptionSafeFlashDevice& operator=(const ExceptionSafeFlashDevice&) = delete;

    const char* Initialize(bool* flashAvailable, const char** operations) override {
        return Guarded([&] {
            device.Initialize();
            *flashAvailable = device.FlashAvailable();
            *operations = device.ListSupportedOperations();
        });
    }

    const char* AddressWithinFlash(std::uint64_t address, bool* within) override {
        return Guarded([&] { *within = device.AddressWithinFlash(Converter::Convert(address)); });
    }

    const char* AddressWithinFlash(std::uint64_t address, std::int32_t size,
                                   bool* within) override {
        return Guarded(
            [&] { *within = device.AddressWithinFlash(Converter::Convert(address), size); });
    }

    const char* WriteDataToFlash(const OtherDataType*, std::uint64_t, std::uint32_t,
                                 std::int16_t) override {
        return Guarded([] { throw std::runtime_error("Unsupported target data type"); });
    }

    // What the device reports by its result, it has shown to the user already.
    const char* WriteDataToFlash(const DataType* data, std::uint64_t address, std::uint32_t length,
                                 std::int16_t page) override {
        return Guarded(
            [&] { device.WriteDataToFlash(data, Converter::Convert(address), length, page); });
    }

    const char* PerformOperation(const char* operation) override {
        return Guarded([&] { device.PerformOperation(operation); });
    }

    const char* ResetSettings(std::int32_t mode) override {
        return Guarded([&] { device.ResetSettings(mode); });
    }

    const char* AddressWithinSpecialRegion(std::uint64_t address, bool* result) override {
        return Guarded([&] {
            Converter::Convert(address);
            *result = false;
        });
    }

    void Destroy() override { delete this; }

  private:
    template <typename Body>
    [[nodiscard]] const char* Guarded(Body body) {
        try {
            body();
            return nullptr;
        } catch (const std::exception& error) {
            return KeepErrorText(lastError, error.what());
        }
    }

    Device device;
    std::string lastError;
};
