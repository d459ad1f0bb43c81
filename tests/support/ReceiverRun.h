// Runs the receiver's stages in one thread, for its tests and its fuzz target.
#ifndef VARNEK_TESTS_SUPPORT_RECEIVERRUN_H
#define VARNEK_TESTS_SUPPORT_RECEIVERRUN_H

#include <algorithm>
#include <clocale>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "Demultiplexer.h"
#include "Names.h"
#include "PacketSource.h"
#include "Report.h"
#include "StreamWriter.h"
#include "Tables.h"

namespace receiver {

using streamwriter::Bytes;

// Reads a stream in blocks of up to `block` bytes. Blocks, packets and sections are in memory of exactly their size, so
// a sanitizer notices a read past them.
inline Report ReadStream(const Bytes &stream, size_t block = 4096) {
    Report report;
    TableParser parser(report.model, LanguageOf(kBrazil));
    Demultiplexer demultiplexer([&](uint16_t pid, const unsigned char *section, size_t size) {
        parser.Push(pid, Bytes(section, section + size).data(), size);
    });
    PacketSource source([&](const unsigned char *packets, size_t count) {
        for (; count > 0; --count, packets += kPacketSize) {
            demultiplexer.Push(Bytes(packets, packets + kPacketSize).data());
        }
    });
    for (size_t at = 0; at < stream.size(); at += block) {
        const auto begin = stream.begin() + static_cast<std::ptrdiff_t>(at);
        const Bytes exact(begin, begin + static_cast<std::ptrdiff_t>(std::min(block, stream.size() - at)));
        source.Feed(exact.data(), exact.size());
    }
    source.Finish();
    report.packets = source.Counters();
    report.sections = demultiplexer.Counters();
    return report;
}

// Returns the text that a function writes to its file.
template <typename Writer>
std::string Written(Writer writer) {
    char *text = nullptr;
    size_t size = 0;
    std::FILE *file = open_memstream(&text, &size);
    writer(file);
    std::fclose(file);
    std::string written(text, size);
    std::free(text);
    return written;
}

inline std::string ToJson(const Report &report) {
    return Written([&](std::FILE *file) { WriteJson(report, file); });
}

inline std::string ToSummary(const Report &report, size_t width) {
    std::setlocale(LC_CTYPE, "C.UTF-8");
    return Written([&](std::FILE *file) { WriteSummary(report, width, file); });
}

}  // namespace receiver

#endif
