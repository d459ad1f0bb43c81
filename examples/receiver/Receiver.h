// The receiver as a program: command line in, summary or messages out.
#ifndef RECEIVER_RECEIVER_H
#define RECEIVER_RECEIVER_H

#include <atomic>
#include <cstdio>
#include <string>
#include <vector>

namespace receiver {

struct Surroundings {
    std::FILE *out;                           // for the summary or the JSON
    std::FILE *err;                           // for messages and the progress line
    const std::atomic<bool> *stop = nullptr;  // ends the reading early when set; null for never
    // On a PC the library logs to descriptor 2. Unless the user asks for the log, it is redirected
    // to this file, so `err` must use another descriptor. With null it stays.
    const char *log_path = nullptr;
};

// Runs the program with its arguments, without the program's name.
//   returns  the exit status, which the manual page explains
int RunReceiver(const std::vector<std::string> &arguments, const Surroundings &surroundings);

}  // namespace receiver

#endif
