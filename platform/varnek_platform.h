// What the library uses of its platform besides the C library; README.md is the contract. Both the
// library and the stand-ins include this header, so that the compiler checks calls and definitions
// against one declaration. Private; plain C.
#ifndef VARNEK_PLATFORM_H
#define VARNEK_PLATFORM_H

#ifdef __cplusplus
extern "C" {
#endif

// The log priorities that the library uses.
enum VarnekLogPriority {
    VARNEK_LOG_VERBOSE = 2,
    VARNEK_LOG_DEBUG = 3,
    VARNEK_LOG_INFO = 4,
    VARNEK_LOG_ERROR = 6,
    VARNEK_LOG_FATAL = 7
};

// Writes one entry to the device's log (liblog).
int __android_log_write(int priority, const char *tag, const char *text);

// Returns the text value of a platform feature; null or `defaultValue` if there is no such feature
// (libvellnativefeature).
const char *VellNativeFeature_getStringWithDefault(const char *key, const char *defaultValue);

#ifdef __cplusplus
}
#endif

#endif
