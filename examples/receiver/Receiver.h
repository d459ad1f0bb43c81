// The receiver as a program: command line in, summary or messages out.
#ifndef RECEIVER_RECEIVER_H
#define RECEIVER_RECEIVER_H

#include <atomic>
#include <cstdio>
#include <string>
#include <vector>

namespace receiver {

// Runs the program on its arguments, the program's name left out. What was read goes to `out`,
// messages go to `err`.
//   stop     ends the reading early when it becomes set; null for never
//   returns  the exit status: 0 when packets were found, 1 when nothing could be read or written or
//            the capture ended early, 2 for a wrong command line, 130 when it was stopped
int RunReceiver(const std::vector<std::string> &arguments, std::FILE *out, std::FILE *err,
                const std::atomic<bool> *stop = nullptr);

}  // namespace receiver

#endif
