// Runs the stages as the stack does: each stage has a thread, and the threads send messages.
#ifndef RECEIVER_PIPELINE_H
#define RECEIVER_PIPELINE_H

#include <atomic>
#include <cstdio>
#include <string>

#include "Capture.h"
#include "Report.h"
#include "StreamFile.h"

namespace receiver {

struct PipelineOptions {
    std::FILE *progress = nullptr;            // a terminal for the progress line; null for none
    Capture *capture = nullptr;               // an open capture; null for none
    const std::atomic<bool> *stop = nullptr;  // ends the reading early when set; may be null
    Code language;                            // of an event's texts, if it has several
};

// Reads an open file to its end, in bounded memory. The threads and their objects are gone when it
// returns, even on failure. They have fixed names, so a process may run one call at a time.
//   report    out: the result; its settings do not change
//   returns   empty, or the name of an object that could not be created; then nothing was read
std::string RunPipeline(StreamFile &file, const PipelineOptions &options, Report &report);

}  // namespace receiver

#endif
