#pragma once

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/model/SornObject.h"
#include "sorn/rpc/OrvoRpcWrapper.h"

class RoxMempool;

namespace rox {
class ByteBuffer;
}

namespace kelbaselib {
class Bytesink;
}

namespace sorn {

class ByteBuffer;

/// ORPC/2, the text form of messages, and the way between messages and the records of the older form.
///
/// A message is "ORPC/2", the byte counts of its header block and of its body and CR, LF; lines of "Name:
/// value" CR, LF and an empty line; the JSON text of the body. docs/formats.md shows it. Operations keep no
/// state; different messages may be worked on by different threads.
class OrvoRpcV2 {
 public:
    /// Bytes of a body's text, and of a header block with its empty line, that may be sent and declared.
    static constexpr unsigned maxBodyLengthG = 0x500000;
    static constexpr unsigned maxHeaderLengthG = 0x100000;

    // Marshalling. Names and values of headers are written as they stand: one with CR, LF inside breaks the
    // framing. Lines stand ascending by name, in byte order, the values of a name in their order. False and
    // words appended to `error`, with nothing written, when the body or the headers are too large. Scratch
    // memory comes from the pool. A body of JSON text is neither parsed nor copied but into the message,
    // unless `pretty`.

    /// Appends the message to the buffer.
    static bool MarshalToString(const ref<OrvoRpcWrapper>& wrapper, ByteBuffer& out, RoxString& error,
                                RoxMempool* pool, bool pretty);
    /// The same in a buffer for this one message, in which the text of a body that has to be written is
    /// written at its place: the message is what stands in the buffer from `begin` on. On a failure the
    /// buffer's contents say nothing.
    static bool MarshalInPlace(const ref<OrvoRpcWrapper>& wrapper, ByteBuffer& out, unsigned& begin,
                               RoxString& error, RoxMempool* pool);
    /// Sets the string, in the pool; it is as it was on failure.
    static bool MarshalToString(const ref<OrvoRpcWrapper>& wrapper, RoxString& out, RoxString& error,
                                RoxMempool* pool, bool pretty);
    /// Without words: empty on failure.
    static RoxString MarshalToString(RoxMempool* pool, const ref<OrvoRpcWrapper>& wrapper, bool pretty);
    /// Streams to the sink, whose Finish it calls at the end; the body's text is made twice, once to be
    /// counted, and is never held. True says that the sizes were kept and nothing else: when the sink refuses
    /// the headers there are words in `error`, and a refused first line or body is not seen at all.
    static bool MarshalToBytesink(const ref<OrvoRpcWrapper>& wrapper, kelbaselib::Bytesink& out,
                                  RoxString& error, RoxMempool* pool, bool pretty);

    // Unmarshalling.

    /// The message at the start of the text, in the pool; what stands behind it is ignored. With `parseBody`
    /// the body's JSON is read at once, and bad JSON fails here; without, the body keeps the text, of which
    /// it is a part when the text lies in the same pool or in the general heap, and otherwise a copy. Null
    /// and words, which replace those of `error` but for a header line without a colon; null and no words
    /// when the first line is not complete. docs/errors.md has the words.
    static ref<OrvoRpcWrapper> UnmarshalFromString(RoxMempool* pool, const RoxString& input, bool parseBody,
                                                   RoxString& error);
    /// The same of bytes that do not change and lie in the same pool or in the general heap: the body is a
    /// slice of them.
    static ref<OrvoRpcWrapper> UnmarshalFromBytes(RoxMempool* pool, const ref<rox::ByteBuffer>& input,
                                                  bool parseBody, RoxString& error);
    /// True when the text begins with a whole message, or with a bad first line: then `length` is the bytes
    /// of the message, or of the whole text, and `error` the words about the first line or empty.
    static bool IsCompleteString(RoxMempool* pool, const RoxString& input, unsigned int& length,
                                 RoxString& error);

    // The older form, in which messages are records. Bodies and headers are shared with the argument but
    // where it is said. Null for null, for anything of no known kind and for a record without its body.

    /// A request becomes an OrvoRpcRequest, and so does an update, which is a request; a response an
    /// OrvoRpcResponse without a version; a cancel an OrvoRpcCancel without headers.
    static ref<SornObject> OrvoRpcV2ToV1(RoxMempool* pool, const ref<OrvoRpcWrapper>& wrapper);
    /// The reverse, by the record's struct. The bodies of requests and of updates, never null, are made anew
    /// of their dictionaries; a greeting (OrvoRpcHello) becomes a request without response, number 0,
    /// version 7.
    static ref<OrvoRpcWrapper> OrvoRpcV1ToV2Wrapper(RoxMempool* pool, const ref<SornObject>& message);
};

}  // namespace sorn
