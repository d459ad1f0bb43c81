// Stand-in for the device's log library: writes logcat's "threadtime" lines to stderr.
#include <stdio.h>
#include <string.h>
#include <sys/syscall.h>
#include <time.h>
#include <unistd.h>

#include "varnek_platform.h"

enum { LINE_SIZE = 4096 };

static char PriorityLetter(int priority) {
    static const char letters[] = "??VDIWEF";
    const int known = priority >= 0 && priority < (int)(sizeof letters - 1);
    return letters[known ? priority : 0];
}

// Writes one log entry and returns how many bytes it wrote, or -1. As in logcat, each line of the
// text gets the header. Each line is one write(), so that the lines of several threads do not mix.
int __android_log_write(int priority, const char *tag, const char *text) {
    struct timespec now;
    struct tm local;
    clock_gettime(CLOCK_REALTIME, &now);
    localtime_r(&now.tv_sec, &local);
    char header[128];
    snprintf(header, sizeof header,
             "%02d-%02d %02d:%02d:%02d.%03ld %5d %5ld %c %s: ", local.tm_mon + 1, local.tm_mday,
             local.tm_hour, local.tm_min, local.tm_sec, now.tv_nsec / 1000000, (int)getpid(),
             syscall(SYS_gettid), PriorityLetter(priority), tag ? tag : "");
    int total = 0;
    const char *rest = text ? text : "";
    do {
        const size_t length = strcspn(rest, "\n");
        char line[LINE_SIZE];
        int size = snprintf(line, sizeof line, "%s%.*s\n", header, (int)length, rest);
        if (size >= LINE_SIZE) {
            size = LINE_SIZE;
            line[LINE_SIZE - 1] = '\n';
        }
        const ssize_t written = write(STDERR_FILENO, line, (size_t)size);
        if (written < 0) {
            return -1;
        }
        total += (int)written;
        rest += length;
        rest += *rest == '\n';
    } while (*rest != '\0');
    return total;
}
