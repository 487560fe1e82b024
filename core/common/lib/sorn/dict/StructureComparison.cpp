#include "rox/RoxWorkStack.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/DictionaryEntries.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/NamedValue.h"
#include "sorn/dict/StringValue.h"
#include "sorn/dict/ValueComparison.h"

namespace sorn {

namespace {

/// Two dictionaries under comparison, at value i of n of one name.
struct Frame {
    DictionaryEntries names;  // of a
    const Dictionary* b;
    RoxCore* pHeld;  // what keeps a alive, held by hand because frames are plain; or null
    DictValue* valueA = nullptr;
    DictValue* valueB = nullptr;
    unsigned i = 0;
    unsigned n = 0;
};

class StructureComparer {
 public:
    explicit StructureComparer(RoxMempool* pool) : poolM(pool), stackM(pool) {}
    StructureComparer(const StructureComparer&) = delete;
    StructureComparer& operator=(const StructureComparer&) = delete;
    ~StructureComparer() {
        while (!stackM.FEmpty()) Leave();
    }

    bool FEqual(const Dictionary& a, const Dictionary& b) {
        if (!Enter(a, b, nullptr)) return false;
        while (!stackM.FEmpty()) {
            Frame& frame = stackM.Top();
            if (frame.i != frame.n) {
                const unsigned i = frame.i++;
                if (!EnterValues(namedvalue::At(frame.valueA, i), namedvalue::At(frame.valueB, i)))
                    return false;
            } else if (!frame.names.FCurrent()) {
                Leave();
            } else if (!NextName(frame)) {
                return false;
            }
        }
        return true;
    }

 private:
    bool Enter(const Dictionary& a, const Dictionary& b, RoxCore* held) {
        // The other's values are compared with this one's names: that is the rule.
        if (b.CountNames() != DictionaryEntries::Count(a)) return false;
        if (held != nullptr) held->UpRef();
        stackM.Push(Frame{DictionaryEntries(a), &b, held});
        return true;
    }

    void Leave() {
        RoxCore* const held = stackM.Top().pHeld;
        stackM.Pop();
        RoxCore::DownRef(held);
    }

    static bool NextName(Frame& frame) {
        const DictionaryEntries::Name name = frame.names.Current();
        DictionaryEntries::Name other;
        frame.names.Next();
        frame.valueA = name.At(0);
        frame.valueB = DictionaryEntries::Find(*frame.b, name, other) ? other.At(0) : nullptr;
        frame.i = 0;
        frame.n = namedvalue::Count(frame.valueA);
        return frame.n == namedvalue::Count(frame.valueB);
    }

    bool EnterValues(const DictValue* a, const DictValue* b) {
        bool isLazyA = false;
        bool isLazyB = false;
        const namedvalue::Kind kind = namedvalue::KindOf(a, isLazyA);
        if (kind != namedvalue::KindOf(b, isLazyB) || kind == namedvalue::OTHER) return false;
        if (kind == namedvalue::TEXT) {
            return static_cast<const StringValue*>(a)->GetValue().FEqual(
                static_cast<const StringValue*>(b)->GetValue());
        }
        if (isLazyB) {  // a dictionary on the other side would become a body of its own
            return isLazyA && LazyDictValue::BodyOf(*a) == LazyDictValue::BodyOf(*b);
        }
        const Dictionary& dictionaryB = *static_cast<const Dictionary*>(b);
        if (!isLazyA) return Enter(*static_cast<const Dictionary*>(a), dictionaryB, nullptr);
        const ref<Dict> dict = DictOfLazyBody(poolM, LazyDictValue::BodyOf(*a));
        return Enter(*dict->GetDictionary(), dictionaryB, dict.GetCore());
    }

    RoxMempool* poolM;
    RoxWorkStack<Frame, 8> stackM;
};

}  // namespace

bool FEqualStructures(const Dictionary& a, const Dictionary& b, RoxMempool* pool) {
    return StructureComparer(pool).FEqual(a, b);
}

}  // namespace sorn
