// Stand-in for the device's feature store: KEY=value lines of one text file, which a process reads
// once. If a key occurs twice, the first line counts.
#include <pthread.h>
#include <stdio.h>
#include <string.h>

#include "varnek_platform.h"

enum { STORE_SIZE = 65536 };

// The content of the file, with a terminator in place of every line end and after the last line.
static char gStore[STORE_SIZE];
static size_t gStoreLength = 0;
static pthread_once_t gStoreLoaded = PTHREAD_ONCE_INIT;

static void LoadStore(void) {
    FILE *file = fopen(VARNEK_FEATURE_FILE, "r");
    if (file == NULL) {
        return;
    }
    gStoreLength = fread(gStore, 1, sizeof gStore - 1, file);
    fclose(file);
    for (size_t i = 0; i < gStoreLength; ++i) {
        if (gStore[i] == '\n' || gStore[i] == '\r') {
            gStore[i] = '\0';
        }
    }
}

// Returns the text value of a feature, or the given default when the store does not have it. The
// value stays valid and unchanged. Thread-safe.
const char *VellNativeFeature_getStringWithDefault(const char *key, const char *defaultValue) {
    pthread_once(&gStoreLoaded, LoadStore);
    const size_t keyLength = key != NULL ? strlen(key) : 0;
    if (keyLength == 0) {
        return defaultValue;
    }
    const char *end = gStore + gStoreLength;
    for (const char *line = gStore; line < end; line += strlen(line) + 1) {
        if (strncmp(line, key, keyLength) == 0 && line[keyLength] == '=') {
            return line + keyLength + 1;
        }
    }
    return defaultValue;
}
