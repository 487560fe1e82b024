#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "rox/RoxWorkStack.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/typedjson/CursorText.h"
#include "sorn/typedjson/InputPointerBytesource.h"
#include "sorn/typedjson/ObjectReaderLevels.h"
#include "sorn/typedjson/ObjectReaderObjects.h"
#include "sorn/typedjson/ObjectReaderWords.h"
#include "sorn/typedjson/PlainMembers.h"

namespace sorn {

/// Reads values and drops them: tests their syntax, numbers the objects and notes the structs of those that
/// are new. The first pass of a read is one such walk. It keeps stacks of its own: 16 bytes for an object
/// under way and one for an array.
class ObjectSkipper {
 public:
    /// Failures leave their words in `words`, which the caller commits. After one the skipper is done.
    ObjectSkipper(RoxMempool* pool, InputPointerBytesource& cursor, ObjectReaderObjects objects,
                  ObjectReaderWords& words)
        : pMempoolM(pool),
          cursorM(cursor),
          objectsM(objects),
          wordsM(words),
          keyM(pool),
          textM(pool),
          stackM(pool),
          levelsM(pool) {}

    bool SkipObject();      ///< must be one
    bool SkipFieldValue();  ///< what stands behind a key and its colon
    bool SkipArray();       ///< or one bare element
    bool SkipElement();     ///< or an array in an array
    bool SkipOne();         ///< an object or a scalar, without words about where it stands

 private:
    static constexpr uint32_t noNumberG = UINT32_MAX;      ///< no object whose type is wanted
    static constexpr uint32_t noObjectG = UINT32_MAX - 1;  ///< no object at all, but a caller's value

    /// An object under way.
    struct Frame {
        union {
            const unsigned char* pKey;  ///< the last key, in the text in memory
            uint32_t keyBegin;          ///< of a stream: where the key begins in the keys
        };
        uint32_t number;   ///< on its first visit
        uint32_t nLevels;  ///< arrays that are open in the value under way
    };
    enum class Step : uint8_t { OPENED, CLOSED, FAILED };

    bool Run(Step step);
    bool RunValue();
    void PushFrame(uint32_t number);
    void PopFrame();
    Step OpenObject();
    Step OpenArray();
    bool SkipPlainMembers(bool& fBehindValue);
    void SkipPlainElements(bool& fBehindValue);
    void KeepKey(Frame& frame, const unsigned char* p, std::string_view key);
    Step ReadMembers(bool fBehindValue);
    Step ReadElements(bool fBehindValue);
    bool ReadKeyAndColon(Frame& frame, bool& isType);
    bool ReadType(uint32_t number);
    bool FailObject(const char* text);
    bool FailArray(const char* text);
    bool FailValue();
    bool FailFrame();
    void AppendKey(const Frame& frame);

    RoxMempool* pMempoolM;
    InputPointerBytesource& cursorM;
    ObjectReaderObjects objectsM;
    ObjectReaderWords& wordsM;
    PlainMembers plainM;
    CursorText keyM;
    CursorText textM;
    RoxWorkStack<Frame, 32> stackM;
    ObjectReaderLevels levelsM;
    std::optional<ByteBuffer> keysM;  ///< of a stream, whose blocks go: the key of each frame
};

}  // namespace sorn
