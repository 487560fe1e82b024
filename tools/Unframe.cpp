#include "tools/Unframe.h"

#include <cinttypes>
#include <cstdio>

#include "rox/RoxMempool.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "tools/ExitCode.h"
#include "tools/MessageLine.h"
#include "tools/MessageStream.h"
#include "tools/Output.h"

namespace sorn::tools {

namespace {

void Refuse(uint64_t offset, const char* words) {
    std::fprintf(stderr, "byte %" PRIu64 ": %s\n", offset, words);
}

bool UnframeOne(const RoxString& bytes, bool parseBody, uint64_t offset, std::FILE* out) {
    RoxMempool pool("sorn unframe");
    RoxString words;
    const ref<OrvoRpcWrapper> message = OrvoRpcV2::UnmarshalFromString(&pool, bytes, parseBody, words);
    if (message == nullptr) {
        Refuse(offset, words.Utf8());
        return false;
    }
    WriteMessageLine(*message, &pool, out);
    return true;
}

/// False when anything was refused.
bool UnframeStream(MessageStream& stream, bool parseBody, std::FILE* out) {
    bool isAllDone = true;
    RoxString bytes;
    RoxString words;
    for (;;) {
        switch (stream.Next(bytes, words)) {
            case MessageStream::MESSAGE:
                isAllDone = UnframeOne(bytes, parseBody, stream.GetOffset(), out) && isAllDone;
                break;
            case MessageStream::JUNK:
                words.FormatAndSet("%s; %" PRIu64 " bytes left out", words.Utf8(), stream.GetLength());
                Refuse(stream.GetOffset(), words.Utf8());
                isAllDone = false;
                break;
            case MessageStream::UNFINISHED:
                Refuse(stream.GetOffset(), "the message is not complete");
                return false;
            case MessageStream::END:
                return isAllDone;
            case MessageStream::FAILED:
                std::perror("input");
                return false;
        }
    }
}

}  // namespace

int Unframe(const UnframeOptions& options) {
    std::FILE* const in = OpenFile(options.inPath, "rbe", stdin);
    if (in == nullptr) return WRONG_USAGE;
    std::FILE* const out = TakeStandardOutput();
    if (out == nullptr) return SOME_REFUSED;
    MessageStream stream(::fileno(in), [out] { std::fflush(out); });
    const bool isAllDone = UnframeStream(stream, options.parseBody, out);
    if (in != stdin) std::fclose(in);
    const bool isWritten = FinishOutput(out);
    std::fclose(out);
    return isWritten && isAllDone ? DONE : SOME_REFUSED;
}

}  // namespace sorn::tools
