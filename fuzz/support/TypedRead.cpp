#include "fuzz/support/TypedRead.h"

#include "fuzz/support/Check.h"
#include "fuzz/support/PieceSource.h"
#include "fuzz/support/RecordContents.h"
#include "fuzz/support/Texts.h"
#include "kelbaselib/InMemoryBytestream.h"
#include "sorn/typedjson/JsonSornObject.h"
#include "sornschema/Success.h"

namespace {

template <class Read>
TypedRead Take(RoxMempool* pool, Read read) {
    TypedRead result;
    // Something that is there already, which a failure has to take away.
    result.record = sornschema::Success::Factory(pool);
    RoxString error;
    result.isGood = read(&result.record, error);
    result.words = error.View();
    Check(result.isGood == (result.record != nullptr), "verdict and result differ");
    Check(!result.isGood || error.FEmpty(), "words about a text that was accepted");
    return result;
}

/// Whether a record's text is read as it was written. The text has brittle bytes, or the name that the
/// writers give to a number without one or to an id without a struct, which no reader takes; or the record
/// holds what its text does not.
bool FComesBack(const ref<sorn::SornObject>& record, const std::string& text) {
    if (FBrittle(text)) return false;
    for (const char* const nameless : {R"("INVALID_VALUE:)", R"("XXX")", "xxx."}) {
        if (text.find(nameless) != text.npos) return false;
    }
    const RecordContents contents = RecordContents::Of(record);
    return !contents.hasNestedAnyDict && !contents.hasUnreadableLazy && !contents.hasNullElement &&
           !contents.hasForeignObject && !contents.hasTypeField && !contents.hasUnreadableScalar;
}

}  // namespace

TypedRead TypedRead::OfMemory(const void* text, size_t n, RoxMempool* pool) {
    return Take(pool, [&](ref<sorn::SornObject>* out, RoxString& error) {
        return sorn::JsonSornObject(pool).JsonToSornObject(static_cast<const unsigned char*>(text),
                                                           static_cast<int>(n), 0, out, error);
    });
}

TypedRead TypedRead::OfSource(const PiecedInput& input, RoxMempool* pool) {
    PieceSource::Counts counts;
    PieceSource* const source = PieceSource::New(input, counts);
    unsigned nRead = 0;
    TypedRead result = Take(pool, [&](ref<sorn::SornObject>* out, RoxString& error) {
        return sorn::JsonSornObject(pool).JsonToSornObject(source, nRead, 0, out, error);
    });
    Check(counts.nSources == 3 && counts.nReleases == 2, "a source is not released once");
    Check(nRead == counts.nFirst, "the bytes read are not those which the source gave");
    source->Release();
    result.nRead = nRead;
    return result;
}

TypedRead TypedRead::OfMemoryStream(const void* text, size_t n, RoxMempool* pool) {
    kelbaselib::InMemoryBytestream stream(pool);
    Check(stream.Write(text, static_cast<unsigned>(n)) == n, "a stream in memory does not take all");
    unsigned nRead = 0;
    TypedRead result = Take(pool, [&](ref<sorn::SornObject>* out, RoxString& error) {
        return sorn::JsonSornObject(pool).JsonToSornObject(&stream, nRead, 0, out, error);
    });
    result.nRead = nRead;
    return result;
}

void CheckTypedTextComesBack(const ref<sorn::SornObject>& record, RoxMempool* pool) {
    const std::string text = TypedText(*record, pool);
    const ref<rox::ByteBuffer> bytes =  // of exact size, so that an access beyond it is seen
        rox::ByteBuffer::New(pool, text.data(), static_cast<uint32_t>(text.size()));
    const TypedRead again = TypedRead::OfMemory(bytes->GetData(), bytes->GetLength(), pool);
    if (!FComesBack(record, text)) return;
    Check(again.isGood, "a written text is refused");
    Check(TypedText(*again.record, pool) == text, "a text read back is written differently");
}
