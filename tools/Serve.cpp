#include "tools/Serve.h"

#include <signal.h>

#include <cstdio>
#include <memory>

#include "service/ServiceLoop.h"
#include "service/Store.h"
#include "tools/ExitCode.h"
#include "tools/Load.h"
#include "tools/TraceWriter.h"
#include "tools/Words.h"

namespace sorn::tools {

int Serve(const ServeOptions& options) {
    ::signal(SIGPIPE, SIG_IGN);  // of a trace that nobody reads any more
    std::string words;
    const std::unique_ptr<service::Store> store =
        service::Store::Open(options.database, service::maxStoreBytesG, words);
    if (store == nullptr) {
        std::fprintf(stderr, "%s: %s\n", options.database.c_str(), LineOfWords(words).c_str());
        return WRONG_USAGE;
    }
    std::unique_ptr<TraceWriter> trace;
    service::ServiceLoop::Observer observer;
    if (options.trace) {
        trace = std::make_unique<TraceWriter>();
        observer = [&trace](std::string_view message) { trace->Show(message); };
    }
    service::ServiceLoop loop(*store, service::Limits(), observer);
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
