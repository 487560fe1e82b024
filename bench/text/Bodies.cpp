#include "text/Bodies.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>

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

Bodies ListOfRecords(size_t nBytes) {
    Bodies lines = ExampleLines();
    // Short records too, so that a small body is a list of several.
    std::erase_if(lines, [](const std::string& line) { return line.size() > 2500; });
    std::string body = "{\"record\": [";
    for (size_t i = 0; body.size() < nBytes; ++i) {
        // A step without a factor in common with most counts mixes the structs.
        body += (i == 0 ? "" : ", ") + lines[i * 37 % lines.size()];
    }
    body += "], \"type\": \"recordList\"}";
    return {body};
}

size_t CountBytes(const Bodies& bodies) {
    size_t nBytes = 0;
    for (const std::string& body : bodies) nBytes += body.size();
    return nBytes;
}

}  // namespace bench
