// The storage layer's own way to the Android log. Private.
#ifndef VARNEK_SOURCE_FILELOG_H
#define VARNEK_SOURCE_FILELOG_H

// Writes a failure of the storage layer at error priority under "SBTVD_File", cut to 1023
// characters. It never traces, so the trace can read its configuration through storage. Leaves
// errno alone.
void __VarnekPGL_FileLog(const char *format, ...) __attribute__((format(printf, 1, 2)));

#endif
