// The exported function: a plug-in to load in place of the real one.

#include "hostcheck/HostCheckDevice.h"
#include "plugin/ErrorText.h"

const char* CreateFlashDevice2(const char* variant, const char* text2, const char* text3,
                               IFlashHost* host, IFlashDevice2** device) {
    if (host == nullptr || device == nullptr)
        return "CreateFlashDevice2: expected a host and a place for the device; came null";
    try {
        *device = new hostcheck::HostCheckDevice(variant, text2, text3, host);
        return nullptr;
    } catch (const std::exception& error) {
        static std::string factoryError;
        return KeepErrorText(factoryError, error.what());
    }
}
