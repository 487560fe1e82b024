#include "sorn/json/ValueWriter.h"

#include <cstring>

#include "rox/VkCast.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/dict/StringValue.h"
#include "sorn/json/StringWriter.h"
#include "sorn/model/SornObject.h"

namespace sorn {

namespace {

/// Asks for what the writing of a value reads first behind the value itself: it lies anywhere, and is wanted
/// soon.
void Prefetch(const DictValue* value) {
    if (value == nullptr) return;
    switch (value->GetTag()) {
        case dictvalue::STRING:
            __builtin_prefetch(static_cast<const StringValue*>(value)->GetValue().GetRepN());
            break;
        case dictvalue::DICTIONARY:
            DictionaryEntries::Prefetch(static_cast<const Dictionary&>(*value));
            break;
        case dictvalue::ARRAY:
            __builtin_prefetch(static_cast<const ArrayValue*>(value)->GetElements().GetData());
            break;
        default:
            break;
    }
}

}  // namespace

bool ValueWriter::Run(size_t depth) {
    while (objectM == nullptr) {
        if (framesM.Size() <= depth) return true;
        if (framesM.Top().array != nullptr) {
            ContinueArray();
        } else {
            ContinueDictionary();
        }
    }
    return false;
}

bool ValueWriter::Begin(const DictValue& value) {
    return !FPrepare(value) || BeginPrepared(value);
}

/// Fetches what a lazy body's text is made of. False when that is nothing: whatever stands around the value
/// is not written then either.
bool ValueWriter::FPrepare(const DictValue& value) {
    if (value.GetTag() != dictvalue::LAZY_DICT) [[likely]]
        return true;
    // Null values share the tag.
    const LazyDictValue* const lazy = VkCast<LazyDictValue>(const_cast<DictValue*>(&value));
    if (lazy == nullptr || lazy->GetValue() == nullptr) return true;
    contentM = LazyBodyToWrite(lazy->GetValue(), formatM.isPretty, outM.FSink());
    return !contentM.FNothing();
}

bool ValueWriter::BeginPrepared(const DictValue& value) {
    switch (value.GetTag()) {
        case dictvalue::STRING: {
            const StringValue& text = static_cast<const StringValue&>(value);
            stringwriter::WriteText(text.GetValue(), text.FNeedQuotes(), outM);
            return true;
        }
        case dictvalue::ARRAY:
            BeginArray(static_cast<const ArrayValue&>(value));
            return false;
        case dictvalue::DICTIONARY:
            BeginDictionary(static_cast<const Dictionary&>(value));
            return false;
        default:
            return BeginNullOrLazy();
    }
}

bool ValueWriter::BeginNullOrLazy() {
    const LazyBodyContent content = std::exchange(contentM, LazyBodyContent());
    if (content.FNothing()) {
        outM.Literal("null");
        return true;
    }
    if (content.dictionary != nullptr) {
        BeginBody(content.dictionary);
        return false;
    }
    if (content.object != nullptr) {
        objectM = content.object;
        objectVersionM = content.version;
        return false;
    }
    outM.Bytes(content.text->GetData(), content.text->GetLength());
    return true;
}

void ValueWriter::BeginBody(const ref<Dictionary>& dictionary) {
    dictionary->UpRef();
    bodiesM.Push({dictionary.get(), formatM.indentLevel});
    formatM.indentLevel = 0;
    BeginDictionary(*dictionary);
    framesM.Top().isBody = true;
}

/// Leaves what BeginBody opened.
void ValueWriter::EndBody() {
    const Body body = bodiesM.Top();
    bodiesM.Pop();
    formatM.indentLevel = body.outerLevel;
    RoxCore::DownRef(body.held);
}

void ValueWriter::BeginArray(const ArrayValue& array) {
    outM.Byte('[');
    NewLine();
    ++formatM.indentLevel;
    framesM.Push({&array, 0, 0, array.CountValues(), false, false, 0});
}

void ValueWriter::BeginDictionary(const Dictionary& dictionary) {
    outM.Byte('{');
    ++formatM.indentLevel;
    framesM.Push({nullptr, 0, 0, DictionaryEntries::Count(dictionary), false, false, namesM.Size()});
    DictionaryEntries::PushSorted(dictionary, namesM);
}

void ValueWriter::ContinueArray() {
    Frame& frame = framesM.Top();
    while (frame.next < frame.count) {
        const DictValue* const element = frame.array->At(frame.next++);
        if (frame.next < frame.count) Prefetch(frame.array->At(frame.next));
        if (frame.next + 1 < frame.count) __builtin_prefetch(frame.array->At(frame.next + 1));
        if (element == nullptr || !FPrepare(*element)) continue;
        if (frame.isBehindFirst) {
            outM.Literal(", ");
            NewLine();
        }
        frame.isBehindFirst = true;
        Indent();
        if (!BeginPrepared(*element)) return;
    }
    End(']');
}

void ValueWriter::ContinueDictionary() {
    Frame& frame = framesM.Top();
    for (; frame.next < frame.count; ++frame.next, frame.nextOfName = 0) {
        // By reference: the two words were stored one by one, and are best loaded so.
        const DictionaryEntries::Name& name = namesM[frame.firstName + frame.next];
        if (frame.next + 2 < frame.count) __builtin_prefetch((&name)[2].GetStored());
        if (frame.next + 1 < frame.count) Prefetch((&name)[1].GetStored());
        const DictValue* const stored = name.GetStored();
        if (stored == nullptr) continue;
        if (stored->GetTag() != dictvalue::NONE) {
            if (frame.nextOfName++ != 0) continue;
            if (!WriteMember(frame, name, *stored)) return;
            continue;
        }
        const unsigned nValues = name.CountValues();
        while (frame.nextOfName < nValues) {
            const DictValue* const value = name.At(frame.nextOfName++);
            if (value != nullptr && !WriteMember(frame, name, *value)) return;
        }
    }
    for (uint32_t i = 0; i < frame.count; ++i) namesM.Pop();
    End('}');
}

/// As Begin.
bool ValueWriter::WriteMember(Frame& frame, const DictionaryEntries::Name& name, const DictValue& value) {
    if (!FPrepare(value)) return true;
    if (frame.isBehindFirst) outM.Literal(", ");
    frame.isBehindFirst = true;
    NewLine();
    Indent();
    stringwriter::WriteQuoted(name.Utf8(), name.NByte(), outM);
    outM.Literal(": ");
    return BeginPrepared(value);
}

void ValueWriter::End(char bracket) {
    NewLine();
    --formatM.indentLevel;
    Indent();
    outM.Byte(bracket);
    if (framesM.Top().isBody) EndBody();
    framesM.Pop();
}

}  // namespace sorn
