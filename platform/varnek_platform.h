// What the library takes from its platform beside the C library; README.md is the contract. The
// library includes this header where it calls these functions, and every stand-in where it defines
// one, so that the compiler checks definitions and calls against one declaration. Private; plain C.
#ifndef VARNEK_PLATFORM_H
#define VARNEK_PLATFORM_H

#ifdef __cplusplus
extern "C" {
#endif

// The priorities of the device's log that the library uses.
enum VarnekLogPriority {
    VARNEK_LOG_VERBOSE = 2,
    VARNEK_LOG_DEBUG = 3,
    VARNEK_LOG_INFO = 4,
    VARNEK_LOG_ERROR = 6,
    VARNEK_LOG_FATAL = 7
};

// Writes one entry to the device's log (liblog).
int __android_log_write(int priority, const char *tag, const char *text);

// The text value of a platform feature; null or `defaultValue` when there is no such feature
// (libvellnativefeature).
const char *VellNativeFeature_getStringWithDefault(const char *key, const char *defaultValue);

#ifdef __cplusplus
}
#endif

#endif
