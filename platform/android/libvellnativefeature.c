// Import library for the device's feature store: the linker takes its name and symbol, and the
// device provides the code. Never installed.
#include "varnek_platform.h"

const char *VellNativeFeature_getStringWithDefault(const char *key, const char *defaultValue) {
    (void)key;
    return defaultValue;
}
