#include "tools/Serve.h"

#include <signal.h>

#include <cstdio>
#include <memory>

#include "rox/RoxMempool.h"
#include "service/ServiceLoop.h"
#include "service/Store.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "tools/ExitCode.h"
#include "tools/LineReader.h"
#include "tools/MessageLine.h"
#include "tools/Output.h"

namespace sorn::tools {

namespace {

using service::Failure;
using service::Service;

/// Lines that are stored together: one by one, each would wait for the disk.
constexpr unsigned batchLinesG = 1000;

bool FBlank(const std::string& line) {
    return line.find_first_not_of(" \t\r") == std::string::npos;
}

void Refuse(const std::string& path, unsigned number, const Failure& failure) {
    std::fprintf(stderr, "%s:%u: %s\n", path.c_str(), number, failure.text.c_str());
}

/// Loads the next lines, from `number` on; false at the end of the file.
bool LoadBatch(Service& service, const std::string& path, LineReader& reader, unsigned& number) {
    Failure failure;
    if (!service.BeginLoad(failure)) return Refuse(path, number, failure), false;
    std::string line;
    bool isMore = false;
    for (unsigned n = 0; n < batchLinesG && (isMore = reader.ReadLine(line)); ++n, ++number) {
        if (!FBlank(line) && !service.Load(line, failure)) Refuse(path, number, failure);
    }
    if (!service.EndLoad(failure)) Refuse(path, number, failure);
    return isMore;
}

/// False when the file cannot be opened.
bool LoadFile(Service& service, const std::string& path) {
    std::FILE* const in = OpenFile(path, "rbe", nullptr);
    if (in == nullptr) return false;
    LineReader reader(::fileno(in));
    unsigned number = 1;
    while (LoadBatch(service, path, reader, number)) {
    }
    if (reader.FFailed()) std::perror(path.c_str());
    std::fclose(in);
    return true;
}

void Trace(std::string_view message) {
    RoxMempool pool("sorn trace");
    RoxString words;
    const ref<OrvoRpcWrapper> wrapper = OrvoRpcV2::UnmarshalFromString(
        &pool, RoxString::FromUtf8Bytes(&pool, static_cast<unsigned>(message.size()), message.data()), false,
        words);
    if (wrapper == nullptr) {
        std::fprintf(stderr, "%s\n", words.Utf8());
    } else {
        WriteMessageLine(*wrapper, &pool, stdout);
        std::fflush(stdout);
    }
}

}  // namespace

int Serve(const ServeOptions& options) {
    ::signal(SIGPIPE, SIG_IGN);  // of a trace that nobody reads any more
    std::string words;
    const std::unique_ptr<service::Store> store =
        service::Store::Open(options.database, service::maxStoreBytesG, words);
    if (store == nullptr) {
        std::fprintf(stderr, "%s: %s\n", options.database.c_str(), words.c_str());
        return WRONG_USAGE;
    }
    service::ServiceLoop loop(*store, service::Limits(), options.trace ? &Trace : nullptr);
    for (const std::string& path : options.vLoads) {
        if (!LoadFile(loop.GetService(), path)) return WRONG_USAGE;
    }
    if (!loop.Listen(options.bus, words)) {
        std::fprintf(stderr, "%s\n", words.c_str());
        return WRONG_USAGE;
    }
    std::fprintf(stderr, "listening on %s\n", loop.GetAddress().c_str());
    if (loop.Run(words)) return DONE;
    std::fprintf(stderr, "%s\n", words.c_str());
    return SOME_REFUSED;
}

}  // namespace sorn::tools
