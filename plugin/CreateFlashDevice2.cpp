// The exported function: the one place that sees both the boundary and the device behind it.

#include "device/FlashCorvane.h"
#include "plugin/ExceptionSafeFlashDevice.h"

using CorvaneFlashDevice =
    ExceptionSafeFlashDevice<Detail::DefaultConverter<unsigned int>, FlashCorvane, unsigned char>;

const char* CreateFlashDevice2(const char* variant, const char* text2, const char* text3,
                               IFlashHost* host, IFlashDevice2** device) {
    try {
        *device = new CorvaneFlashDevice(variant, text2, text3, host);
        return nullptr;
    } catch (const std::exception& error) {
        static std::string factoryError;
        return KeepErrorText(factoryError, error.what());
    }
}
