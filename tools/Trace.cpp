#include "tools/Trace.h"

#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <mutex>

#include "rox/RoxAssert.h"
#include "rox/RoxMempool.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "tools/Interrupt.h"
#include "tools/MessageLine.h"
#include "tools/Words.h"

namespace sorn::tools {

namespace {

std::string LineOf(OrvoRpcWrapper& message, RoxMempool* pool) {
    char* bytes = nullptr;
    size_t nBytes = 0;
    std::FILE* const file = ::open_memstream(&bytes, &nBytes);
    RoxAssert(file != nullptr, "memory for a line of the trace");
    WriteMessageLine(message, pool, file);
    std::fclose(file);
    std::string line(bytes, nBytes);
    std::free(bytes);
    return line;
}

}  // namespace

TraceLine::TraceLine(std::string_view message) {
    RoxMempool pool("sorn trace");
    RoxString words;
    const ref<OrvoRpcWrapper> wrapper = OrvoRpcV2::UnmarshalFromString(
        &pool, RoxString::FromUtf8Bytes(&pool, static_cast<unsigned>(message.size()), message.data()), false,
        words);
    isMessage = wrapper != nullptr;
    if (isMessage) {
        text = LineOf(*wrapper, &pool);
    } else {
        text = (words.FEmpty() ? "the message is not complete" : LineOfWords(words.View())) + "\n";
    }
}

void TraceMessage(bool, const char* bytes, unsigned nBytes) {
    const TraceLine line({bytes, nBytes});
    static std::mutex mutex;  // messages of several threads do not mix
    static bool isWhole = true;
    const std::lock_guard<std::mutex> lock(mutex);
    if (isWhole) isWhole = WriteUnlessInterrupted(STDERR_FILENO, line.text);
}

}  // namespace sorn::tools
