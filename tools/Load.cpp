#include "tools/Load.h"

#include <cstdio>

#include "tools/LineReader.h"
#include "tools/Output.h"
#include "tools/Words.h"

namespace sorn::tools {

namespace {

using service::Failure;
using service::Service;

/// Lines that are stored together: one by one, each would wait for the disk.
constexpr unsigned batchLinesG = 1000;

bool FBlank(const std::string& line) {
    return line.find_first_not_of(" \t\r") == std::string::npos;
}

void RefuseLine(const std::string& path, unsigned number, const Failure& failure) {
    std::fprintf(stderr, "%s:%u: %s\n", path.c_str(), number, LineOfWords(failure.text).c_str());
}

void RefuseLines(const std::string& path, unsigned first, unsigned last, const Failure& failure) {
    if (first >= last) return RefuseLine(path, first, failure);
    std::fprintf(stderr, "%s: lines %u to %u were not stored: %s\n", path.c_str(), first, last,
                 LineOfWords(failure.text).c_str());
}

/// Loads the next lines, from `number` on; false when no more are to come.
bool LoadBatch(Service& service, const std::string& path, LineReader& reader, unsigned& number) {
    Failure failure;
    if (!service.BeginLoad(failure)) {
        std::fprintf(stderr, "%s: the lines from %u on were not stored: %s\n", path.c_str(), number,
                     LineOfWords(failure.text).c_str());
        return false;
    }
    const unsigned first = number;
    std::string line;
    bool isMore = false;
    for (unsigned n = 0; n < batchLinesG && (isMore = reader.ReadLine(line)); ++n, ++number) {
        if (FBlank(line) || service.FLoadLost() || service.Load(line, failure)) continue;
        if (!service.FLoadLost()) RefuseLine(path, number, failure);
    }
    if (!service.EndLoad(failure) && number > first) RefuseLines(path, first, number - 1, failure);
    return isMore;
}

}  // namespace

bool LoadFile(Service& service, const std::string& path) {
    std::FILE* const in = OpenFile(path, "rbe", nullptr);
    if (in == nullptr) return false;
    LineReader reader(::fileno(in));
    unsigned number = 1;
    while (LoadBatch(service, path, reader, number)) {
    }
    std::fclose(in);
    if (!reader.FFailed()) return true;
    std::fprintf(stderr, "%s:%u: %s\n", path.c_str(), number, reader.FailureWords().c_str());
    return false;
}

}  // namespace sorn::tools
