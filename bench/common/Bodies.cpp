#include "common/Bodies.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>

namespace bench {

Bodies ExampleLines() {
    std::vector<std::filesystem::path> files;
    for (const auto& entry : std::filesystem::directory_iterator(SORN_EXAMPLE_DATA)) {
        if (entry.path().extension() == ".jsonl") files.push_back(entry.path());
    }
    std::sort(files.begin(), files.end());
    Bodies lines;
    for (const auto& file : files) {
        std::ifstream in(file);
        for (std::string line; std::getline(in, line);) {
            if (!line.empty()) lines.push_back(line);
        }
    }
    if (lines.empty()) {
        std::fprintf(stderr, "no records in %s\n", SORN_EXAMPLE_DATA);
        std::exit(1);
    }
    return lines;
}

namespace {

/// Short records, so that a small body is a list of several. None with maps in a map of free form: the typed
/// reader counts those as records, and takes what follows in a list for the wrong struct.
bool FGoesIntoList(const std::string& line) {
    if (line.size() > 2500) return false;
    const char* const withMaps[] = {"channelMapConfigInstructions", "localApplicationData", "uiNavigate"};
    return std::none_of(std::begin(withMaps), std::end(withMaps), [&line](const char* name) {
        return line.find("\"type\": \"" + std::string(name)) != std::string::npos;
    });
}

}  // namespace

Bodies ListOfRecords(size_t nBytes, size_t nBytesOfMix) {
    Bodies lines = ExampleLines();
    std::erase_if(lines, [](const std::string& line) { return !FGoesIntoList(line); });
    std::string body = "{\"isBottom\": true, \"isTop\": true, \"resolvedObject\": [";
    size_t next = 0;
    for (size_t nOfMix = 0; body.size() < nBytes;) {
        if (nOfMix != 0) body += ", ";
        if (nOfMix >= nBytesOfMix) next = nOfMix = 0;
        // A step without a factor in common with most counts mixes the structs.
        const std::string& line = lines[next++ * 37 % lines.size()];
        body += line;
        nOfMix += line.size();
    }
    body += "], \"type\": \"idSequence\"}";
    return {body};
}

size_t CountBytes(const Bodies& bodies) {
    size_t nBytes = 0;
    for (const std::string& body : bodies) nBytes += body.size();
    return nBytes;
}

}  // namespace bench
