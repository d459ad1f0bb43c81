// The receiver as a program: command line in, summary or messages out.
#ifndef RECEIVER_RECEIVER_H
#define RECEIVER_RECEIVER_H

#include <atomic>
#include <cstdio>
#include <string>
#include <vector>

namespace receiver {

struct Surroundings {
    std::FILE *out;                           // for what was read
    std::FILE *err;                           // for messages and the progress line
    const std::atomic<bool> *stop = nullptr;  // ends the reading early when set; null for never
    // The file into which descriptor 2, where the library's log goes on a PC, is led unless the
    // user asks for the log; `err` must not write through that descriptor then. Null leaves it
    // alone.
    const char *log_path = nullptr;
};

// Runs the program on its arguments, the program's name left out.
//   returns  the exit status: 0 when a stream was read, 1 when nothing could be read or written, it
//            is no stream, or reading or the capture ended early, 2 for a wrong command line, 130
//            when it was stopped
int RunReceiver(const std::vector<std::string> &arguments, const Surroundings &surroundings);

}  // namespace receiver

#endif
