// The stages as the stack runs them: each in a thread of its own, handing on by messages.
#ifndef RECEIVER_PIPELINE_H
#define RECEIVER_PIPELINE_H

#include <cstdio>
#include <string>

#include "Presentation.h"
#include "StreamFile.h"

namespace receiver {

// Reads an open file to its end, in bounded memory. The threads and everything made for them are
// gone when it returns, also on failure. Their names are fixed: one call at a time in a process.
//   progress  a terminal for the progress line, which is erased at the end; null for none
//   report    what was read
//   returns   empty; else what could not be created, and nothing was read
std::string RunPipeline(StreamFile &file, std::FILE *progress, Report &report);

}  // namespace receiver

#endif
