#include "tools/Trace.h"

#include <cstdio>

#include "rox/RoxMempool.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "tools/MessageLine.h"

namespace sorn::tools {

void TraceMessage(bool, const char* bytes, unsigned nBytes) {
    RoxMempool pool("sorn trace");
    RoxString words;
    const ref<OrvoRpcWrapper> message =
        OrvoRpcV2::UnmarshalFromString(&pool, RoxString::FromUtf8Bytes(&pool, nBytes, bytes), false, words);
    ::flockfile(stderr);  // messages of several threads do not mix
    if (message == nullptr) {
        std::fprintf(stderr, "%s\n", words.Utf8());
    } else {
        WriteMessageLine(*message, &pool, stderr);
    }
    ::funlockfile(stderr);
}

}  // namespace sorn::tools
