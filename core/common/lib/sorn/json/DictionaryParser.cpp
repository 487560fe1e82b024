#include "sorn/json/DictionaryParser.h"

#include <utility>

#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/json/ScalarReader.h"

namespace sorn {

namespace {

constexpr std::string_view valueWrapperG = " Failed to parse value for key ";
constexpr std::string_view fieldWrapperG = " for Object field ";
constexpr std::string_view scalarElementWrapperG = " for Array element.";
constexpr std::string_view firstElementWrapperG = " Failed to parse an array element.";
constexpr std::string_view laterElementWrapperG = " Failed to parse an array member.";
constexpr std::string_view tooManyElementsG = "Too many elements in an array";
constexpr std::string_view tooManyValuesG = "Too many values of a name";

/// Beyond this many bytes the outer wrappers are left out: the words grow by up to 34 bytes with each byte of
/// input.
constexpr size_t maxWordsG = 1u << 30;

bool FIsAt(const unsigned char* p, const unsigned char* end, unsigned char byte) {
    return p < end && *p == byte;
}

bool FOpensContainer(const unsigned char* p, const unsigned char* end) {
    return p < end && (*p == '{' || *p == '[');
}

std::string_view ViewOf(const RoxStringRepN* rep) {
    return rep == nullptr ? std::string_view("") : std::string_view(rep->GetBytes(), rep->GetLength());
}

/// Without a holder.
DictValue* NewContainer(RoxMempool* pool, bool isDictionary) {
    if (isDictionary) return NewValue<Dictionary>(pool);
    return NewValue<ArrayValue>(pool);
}

}  // namespace

bool DictionaryParser::ReadObject(Dictionary& object) {
    pM = textscan::SkipWhitespace(pM, pEndM);
    // The words stay when the rest is good, and the read goes on: callers look at the byte first.
    if (!FIsAt(pM, pEndM, '{')) errorM = "JSON object does not start with '{'.";
    if (pM < pEndM) ++pM;
    return Run(&object, true);
}

bool DictionaryParser::ReadArray(ArrayValue& array) {
    pM = textscan::SkipWhitespace(pM, pEndM);
    if (!FIsAt(pM, pEndM, '[')) errorM = "Array must start with '['.";
    if (pM < pEndM) ++pM;
    return Run(&array, false);
}

bool DictionaryParser::ReadMemberValue(Dictionary& object, const RoxString& key) {
    const Bytes p = textscan::SkipWhitespace(pM, pEndM);
    if (FOpensContainer(p, pEndM)) {
        const bool isDictionary = *p == '{';
        const ref<DictValue> container(NewContainer(pMempoolM, isDictionary));
        pM = p + 1;
        if (object.Add(key, container)) return Run(container.get(), isDictionary);
    } else {
        DictValue* value = nullptr;
        const char* words = "";
        const Bytes behind = ReadScalarAt(p, pEndM, pMempoolM, value, words);
        if (behind == nullptr) {
            Fail(p, {words, fieldWrapperG, key.View()});
            return false;
        }
        cursorM.pCurrentM = behind;
        if (object.Add(key, ref<DictValue>(value))) return true;
    }
    Fail(p, {tooManyValuesG});
    return false;
}

bool DictionaryParser::ReadElementValue(ArrayValue& array) {
    const Bytes p = textscan::SkipWhitespace(pM, pEndM);
    if (FOpensContainer(p, pEndM)) {
        const bool isDictionary = *p == '{';
        const ref<DictValue> container(NewContainer(pMempoolM, isDictionary));
        pM = p + 1;
        if (array.Add(container)) return Run(container.get(), isDictionary);
    } else {
        DictValue* value = nullptr;
        const char* words = "";
        const Bytes behind = ReadScalarAt(p, pEndM, pMempoolM, value, words);
        if (behind == nullptr) {
            Fail(p, {words, scalarElementWrapperG});
            return false;
        }
        cursorM.pCurrentM = behind;
        if (array.Add(ref<DictValue>(value))) return true;
    }
    Fail(p, {tooManyElementsG});
    return false;
}

/// Reads from behind the opening bracket of the container to behind its closing one.
bool DictionaryParser::Run(DictValue* container, bool isDictionary) {
    stackM.Push({container, nullptr, isDictionary, false});
    keyCacheM.Open(pEndM > pM ? static_cast<size_t>(pEndM - pM) : 0);
    bool fBehindValue = false;
    while (!stackM.FEmpty()) {
        const Step step = stackM.Top().isDictionary ? ReadMembers(fBehindValue) : ReadElements(fBehindValue);
        if (step == Step::failed) return false;
        if (step == Step::closed) stackM.Pop();
        fBehindValue = step == Step::closed;
    }
    cursorM.pCurrentM = pM;
    return true;
}

/// Reads members of the dictionary on top until it ends, or a container opens in it.
DictionaryParser::Step DictionaryParser::ReadMembers(bool fBehindValue) {
    Dictionary& object = *static_cast<Dictionary*>(stackM.Top().container);
    Bytes p = pM;
    for (;; fBehindValue = true) {
        p = textscan::SkipWhitespace(p, pEndM);
        if (fBehindValue) {
            if (!FIsAt(p, pEndM, ',')) break;
            p = textscan::SkipWhitespace(p + 1, pEndM);
        }
        // A comma may trail.
        if (p >= pEndM || !byteclass::FIs(*p, byteclass::STARTS_KEY)) break;
        Member member;
        p = ReadKey(p, object, member);
        if (p == nullptr) return Step::failed;
        p = textscan::SkipWhitespace(p, pEndM);
        if (FOpensContainer(p, pEndM)) return OpenMember(p, object, member);
        p = AddScalarMember(p, object, member);
        if (p == nullptr) return Step::failed;
    }
    if (FIsAt(p, pEndM, '}')) {
        pM = p + 1;
        return Step::closed;
    }
    Fail(p, {"JSON object does not end with '}'."});
    return Step::failed;
}

/// Reads elements of the array on top until it ends, or a container opens in it.
DictionaryParser::Step DictionaryParser::ReadElements(bool fBehindValue) {
    // NOLINTNEXTLINE(clang-analyzer-core.NullDereference): a frame always has its container
    ArrayValue& array = *static_cast<ArrayValue*>(stackM.Top().container);
    Bytes p = textscan::SkipWhitespace(pM, pEndM);
    if (!fBehindValue && FIsAt(p, pEndM, ']')) {
        pM = p + 1;
        return Step::closed;
    }
    for (;; fBehindValue = true) {
        if (fBehindValue) {
            p = textscan::SkipWhitespace(p, pEndM);
            if (!FIsAt(p, pEndM, ',')) break;
            p = textscan::SkipWhitespace(p + 1, pEndM);
            stackM.Top().isLaterElement = true;
        }
        if (FOpensContainer(p, pEndM)) return OpenElement(p, array);
        p = AddScalarElement(p, array);
        if (p == nullptr) return Step::failed;
    }
    if (FIsAt(p, pEndM, ']')) {
        pM = p + 1;
        return Step::closed;
    }
    Fail(p, {"Array must end with ']'."});
    return Step::failed;
}

/// The key of these bytes, with a hold for the caller.
RoxStringRepN* DictionaryParser::KeyOf(Bytes bytes, size_t n) {
    if (n == 0) return nullptr;
    if (RoxStringRepN* const cached = keyCacheM.Find(bytes, n); cached != nullptr) {
        cached->UpRef();
        return cached;
    }
    RoxStringRepN* const key = RoxStringRepN::New(pMempoolM, static_cast<uint32_t>(n));
    std::memcpy(key->MutableBytes(), bytes, n);
    return key;
}

/// Reads a key and gives the place behind it, null on failure.
DictionaryParser::Bytes DictionaryParser::FindKey(Bytes p, RoxStringRepN*& key) {
    if (*p != '"') {
        const Bytes tokenEnd = textscan::FindTokenEnd(p, pEndM);
        key = KeyOf(p, static_cast<size_t>(tokenEnd - p));
        return tokenEnd;
    }
    QuotedText text;
    if (!text.Find(p + 1, pEndM)) return Fail(p, {"Failed to parse a Dictionary key."});
    if (text.FPlain()) [[likely]] {
        key = KeyOf(text.Begin(), static_cast<size_t>(text.TextEnd() - text.Begin()));
    } else {
        const RoxString decoded = text.Take(pMempoolM);
        key = KeyOf(reinterpret_cast<Bytes>(decoded.Utf8()), decoded.NByte());
    }
    return text.Behind();
}

/// Reads a key, which must be new, and its colon. Gives the place behind the colon, null on failure.
DictionaryParser::Bytes DictionaryParser::ReadKey(Bytes p, Dictionary& object, Member& member) {
    p = FindKey(p, member.key);
    if (p == nullptr) return nullptr;
    member.place = DictionaryFiller::Open(object, member.key, member.isNew);
    if (member.isNew) [[likely]] {
        if (member.key != nullptr) keyCacheM.Keep(member.key);
    } else if (DictionaryFiller::FHasValue(member.place)) {
        Fail(p, {"Duplicate key: ", ViewOf(member.key)});
        Drop(object, member);
        return nullptr;
    }
    p = textscan::SkipWhitespace(p, pEndM);
    if (FIsAt(p, pEndM, ':')) return p + 1;
    Drop(object, member);
    return Fail(p, {"JSON field name must be followed by a colon."});
}

/// Undoes what ReadKey did.
void DictionaryParser::Drop(Dictionary& object, const Member& member) {
    if (member.isNew) {
        DictionaryFiller::Abandon(object, member.place);
    } else {
        RoxStringRepNOwner::Disown(member.key);
    }
}

/// Gives the key its value, which has no holder yet. False after a failure.
bool DictionaryParser::AddMember(Bytes p, Dictionary& object, const Member& member, DictValue* value) {
    if (member.isNew) [[likely]] {
        DictionaryFiller::Fill(member.place, value);
        return true;
    }
    const RoxString key = RoxString::AdoptRepN(member.key);
    if (object.Add(key, ref<DictValue>(value))) return true;
    Fail(p, {tooManyValuesG, valueWrapperG, key.View()});
    return false;
}

DictionaryParser::Step DictionaryParser::OpenMember(Bytes p, Dictionary& object, const Member& member) {
    const bool isDictionary = *p == '{';
    DictValue* const container = NewContainer(pMempoolM, isDictionary);
    if (!AddMember(p, object, member, container)) return Step::failed;
    stackM.Top().key = DictionaryFiller::NameOf(member.place);
    stackM.Push({container, nullptr, isDictionary, false});
    pM = p + 1;
    return Step::opened;
}

DictionaryParser::Step DictionaryParser::OpenElement(Bytes p, ArrayValue& array) {
    const bool isDictionary = *p == '{';
    DictValue* const container = NewContainer(pMempoolM, isDictionary);
    if (!array.AddNew(container)) {
        const ref<DictValue> dropped(container);
        Fail(p, {tooManyElementsG, ElementWrapper()});
        return Step::failed;
    }
    stackM.Push({container, nullptr, isDictionary, false});
    pM = p + 1;
    return Step::opened;
}

DictionaryParser::Bytes DictionaryParser::AddScalarMember(Bytes p, Dictionary& object, const Member& member) {
    DictValue* value = nullptr;
    const char* words = "";
    const Bytes behind = ReadScalarAt(p, pEndM, pMempoolM, value, words);
    if (behind == nullptr) {
        const std::string_view key = ViewOf(member.key);
        Fail(p, {words, fieldWrapperG, key, valueWrapperG, key});
        Drop(object, member);
        return nullptr;
    }
    return AddMember(p, object, member, value) ? behind : nullptr;
}

DictionaryParser::Bytes DictionaryParser::AddScalarElement(Bytes p, ArrayValue& array) {
    DictValue* value = nullptr;
    const char* words = "";
    const Bytes behind = ReadScalarAt(p, pEndM, pMempoolM, value, words);
    if (behind == nullptr) return Fail(p, {words, scalarElementWrapperG, ElementWrapper()});
    if (array.AddNew(value)) [[likely]]
        return behind;
    const ref<DictValue> dropped(value);
    return Fail(p, {tooManyElementsG, ElementWrapper()});
}

std::string_view DictionaryParser::ElementWrapper() const {
    return stackM.Top().isLaterElement ? laterElementWrapperG : firstElementWrapperG;
}

/// Gives null. The words: the innermost first, then what each open container but the top one was reading. One
/// pass measures and one writes, so that the cost is that of the text.
DictionaryParser::Bytes DictionaryParser::Fail(Bytes p, Words innermost) {
    cursorM.pCurrentM = p;
    const auto visit = [&](auto take) {
        for (std::string_view piece : innermost) take(piece);
        for (size_t i = stackM.Size(); i-- > 1;) {
            const Frame& frame = stackM[i - 1];
            if (frame.isDictionary) {
                take(valueWrapperG);
                take(ViewOf(frame.key));
            } else {
                take(frame.isLaterElement ? laterElementWrapperG : firstElementWrapperG);
            }
        }
    };
    size_t length = 0;
    visit([&](std::string_view piece) {
        if (piece.size() <= maxWordsG - length) length += piece.size();
    });
    RoxStringRepN* const rep = RoxStringRepN::New(errorM.GetMempool(), static_cast<uint32_t>(length));
    char* out = rep->MutableBytes();
    char* const outEnd = out + length;
    visit([&](std::string_view piece) {
        if (piece.size() > static_cast<size_t>(outEnd - out)) return;
        std::memcpy(out, piece.data(), piece.size());
        out += piece.size();
    });
    errorM = RoxString::AdoptRepN(rep);
    return nullptr;
}

}  // namespace sorn
