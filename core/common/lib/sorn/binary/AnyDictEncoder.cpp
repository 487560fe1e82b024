#include "sorn/binary/AnyDictEncoder.h"

#include "sorn/binary/LazyLevels.h"
#include "sorn/binary/WireFormat.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/NamedValue.h"
#include "sorn/dict/StringValue.h"

namespace sorn {

namespace {

/// A tag of one byte and a length.
constexpr size_t maxHeadG = 1 + varint::maxBytes64G;

/// What Dict sees under a name: of several values that were added to a Dictionary, the first.
DictValue* SeenValue(const DictionaryEntries::Name& name) {
    return name.At(0);
}

}  // namespace

AnyDictEncoder::~AnyDictEncoder() {
    for (; !stackM.FEmpty(); stackM.Pop()) RoxCore::DownRef(stackM.Top().pHeld);
}

void AnyDictEncoder::Body(const Dictionary& dictionary) {
    Open(dictionary, nullptr, 0, BODY);
    Run();
}

void AnyDictEncoder::Entry(const Dictionary& dictionary, const RoxString& name) {
    DictValue* const value = dictionary.Find(name);
    namesM.Emplace(name.GetRepN(), value);
    const size_t end = outM.Count();
    stackM.Push({1, namedvalue::Count(value), end, end, nullptr, 0, true, ENTRY});
    Run();
}

void AnyDictEncoder::Value(DictValue* value) {
    bool isLazy = false;
    const namedvalue::Kind kind = namedvalue::KindOf(value, isLazy);
    if (kind == namedvalue::TEXT) {
        const RoxString& text = static_cast<StringValue*>(value)->GetValue();
        WriteText(text.Utf8(), text.NByte(), wireformat::textTagG);
    } else if (kind == namedvalue::DICT && isLazy) {
        OpenLazyBody(*value, 1, BODY);
    } else if (kind == namedvalue::DICT) {
        Open(*static_cast<Dictionary*>(value), nullptr, 0, BODY);
    }
    Run();
}

void AnyDictEncoder::Run() {
    while (!stackM.FEmpty()) {
        Frame& frame = stackM.Top();
        if (frame.fInEntry) {
            StepEntry(frame);
        } else if (frame.nNames != 0) {
            frame.fInEntry = true;
            frame.nValues = namedvalue::Count(SeenValue(namesM.Top()));
            frame.endOfEntry = outM.Count();
        } else {
            if (frame.form == VALUE) WriteHead(frame.endOfBody, wireformat::valueTagG);
            RoxCore* const held = frame.pHeld;
            stackM.Pop();
            RoxCore::DownRef(held);
        }
    }
}

void AnyDictEncoder::StepEntry(Frame& frame) {
    if (frame.nValues != 0) {
        WriteValue(namedvalue::At(SeenValue(namesM.Top()), --frame.nValues));
        return;
    }
    WriteText(namesM.Top().Utf8(), namesM.Top().NByte(), wireformat::nameTagG);
    if (frame.form != ENTRY) WriteHead(frame.endOfEntry, wireformat::entryTagG);
    namesM.Pop();
    --frame.nNames;
    frame.fInEntry = false;
}

/// Writes a value with its tag and length, or opens the dictionary that it is. Frames may move.
void AnyDictEncoder::WriteValue(DictValue* value) {
    bool isLazy = false;
    switch (namedvalue::KindOf(value, isLazy)) {
        case namedvalue::TEXT: {
            const size_t end = outM.Count();
            const RoxString& text = static_cast<StringValue*>(value)->GetValue();
            WriteText(text.Utf8(), text.NByte(), wireformat::textTagG);
            WriteHead(end, wireformat::valueTagG);
            break;
        }
        case namedvalue::DICT:
            if (isLazy) {
                OpenLazyBody(*value, stackM.Top().nLazyLevels + 1, VALUE);
            } else {
                Open(static_cast<Dictionary&>(*value), nullptr, stackM.Top().nLazyLevels, VALUE);
            }
            break;
        case namedvalue::OTHER:
            WriteHead(outM.Count(), wireformat::valueTagG);
            break;
    }
}

void AnyDictEncoder::OpenLazyBody(const DictValue& value, uint32_t nLazyLevels, Form form) {
    ref<Dictionary> dictionary;
    if (nLazyLevels > maxLazyLevelsG) {
        dictionary = NewTooDeepError(pMempoolM);
    } else {
        dictionary = DictOfLazyBody(pMempoolM, LazyDictValue::BodyOf(value))->GetDictionary();
    }
    dictionary->UpRef();
    Open(*dictionary, dictionary.get(), nLazyLevels, form);
}

/// Takes over a hold on `held`, which may be null.
void AnyDictEncoder::Open(const Dictionary& dictionary, RoxCore* held, uint32_t nLazyLevels, Form form) {
    const size_t end = outM.Count();
    const size_t nBefore = namesM.Size();
    DictionaryEntries::PushSorted(dictionary, namesM);
    const auto nNames = static_cast<uint32_t>(namesM.Size() - nBefore);
    stackM.Push({nNames, 0, end, end, held, nLazyLevels, false, form});
}

/// The length of what was written since `end` bytes, and the tag before it.
void AnyDictEncoder::WriteHead(size_t end, unsigned char tag) {
    unsigned char* p = outM.Room(outM.Begin(), maxHeadG);
    p = varint::WriteBefore(outM.Count(p) - end, p);
    *--p = tag;
    outM.Commit(p);
}

void AnyDictEncoder::WriteText(const char* bytes, uint32_t n, unsigned char tag) {
    const size_t end = outM.Count();
    outM.Commit(outM.Bytes(outM.Begin(), bytes, n));
    WriteHead(end, tag);
}

}  // namespace sorn
