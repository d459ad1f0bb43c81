// Import library of the device's feature store, from which the linker takes name and symbol, while
// the device provides the code. Never installed.
#include "varnek_platform.h"

const char *VellNativeFeature_getStringWithDefault(const char *key, const char *defaultValue) {
    (void)key;
    return defaultValue;
}
