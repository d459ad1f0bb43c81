// The stages as the stack runs them: each in a thread of its own, handing on by messages.
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
    Code language;                            // of events' texts, where they come in several
};

// Reads an open file to its end, in bounded memory. The threads and everything made for them are
// gone when it returns, also on failure. Their names are fixed: one call at a time in a process.
//   report    out: the result; its settings are left as they are
//   returns   empty; else the name of an object that could not be created, and nothing was read
std::string RunPipeline(StreamFile &file, const PipelineOptions &options, Report &report);

}  // namespace receiver

#endif
