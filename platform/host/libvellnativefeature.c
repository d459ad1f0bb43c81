// Stand-in for the device's feature store: a text file of KEY=value lines, which a process reads
// once, and in which the first line of a key counts.
#include <pthread.h>
#include <stdio.h>
#include <string.h>

#include "varnek_platform.h"

enum { STORE_SIZE = 65536 };

// The file's content, with a terminator for every line end and after the last line.
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

// Thread-safe. A value stays valid and unchanged.
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
