// Import library of the device's feature store: the linker notes its name and its symbol, the
// device brings the code. Never installed.
#include "varnek_platform.h"

const char *VellNativeFeature_getStringWithDefault(const char *key, const char *defaultValue) {
    (void)key;
    return defaultValue;
}
