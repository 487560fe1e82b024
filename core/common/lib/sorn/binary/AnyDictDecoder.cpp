#include "sorn/binary/AnyDictDecoder.h"

#include "sorn/binary/Varint.h"
#include "sorn/binary/WireFormat.h"
#include "sorn/dict/Dictionary.h"

namespace sorn {

namespace {

/// What an empty dictionary takes, and its place in a growing array.
constexpr uint32_t dictionaryBytesG = sizeof(Dictionary) + 2 * sizeof(void*);

void DropName(RoxStringRepN* name) {
    if (name != nullptr) name->DownRef();
}

}  // namespace

AnyDictDecoder::~AnyDictDecoder() {
    while (!stackM.FEmpty()) PopFrame();
}

bool AnyDictDecoder::Value(const unsigned char* begin, const unsigned char* end, bool& fText, RoxString& text,
                           ref<Dict>& dict) {
    fText = begin != end && *begin == wireformat::textTagG;
    // A text stands alone: neither behind entries nor before them.
    if (fText) return dict == nullptr && ReadText(begin, end, text);
    ref<Dict> read = dict != nullptr ? dict : NewDict();
    if (read == nullptr) return false;
    Push(read, begin, end);
    if (!Run()) return false;
    dict = std::move(read);
    return true;
}

bool AnyDictDecoder::Entry(const unsigned char* begin, const unsigned char* end, Dict& dict) {
    Push(ref<Dict>(&dict), end, end);
    return OpenEntry(stackM.Top(), begin, end) && Run();
}

bool AnyDictDecoder::Run() {
    while (!stackM.FEmpty()) {
        if (!Step()) return false;
    }
    return true;
}

bool AnyDictDecoder::Step() {
    Frame& frame = stackM.Top();
    if (frame.pInEntry != nullptr) return StepEntry();
    if (frame.pInBody == frame.pBodyEnd) return CloseBody();
    Item item;
    return ReadItem(frame.pInBody, frame.pBodyEnd, item) && item.tag == wireformat::entryTagG &&
           OpenEntry(frame, item.begin, item.end);
}

/// Looks for the entry's name, so that its values can be stored in a second pass.
bool AnyDictDecoder::OpenEntry(Frame& frame, const unsigned char* begin, const unsigned char* end) const {
    const unsigned char* p = begin;
    Item item;
    do {
        if (!ReadItem(p, end, item)) return false;
    } while (item.tag != wireformat::nameTagG);
    const auto nBytes = static_cast<uint32_t>(item.end - item.begin);
    if (nBytes != 0) {
        frame.pName = RoxStringRepN::New(pMempoolM, nBytes);
        std::memcpy(frame.pName->MutableBytes(), item.begin, nBytes);
    }
    frame.pInEntry = begin;
    frame.pEntryEnd = end;
    return true;
}

/// Takes the next item of the entry under way.
bool AnyDictDecoder::StepEntry() {
    Frame& frame = stackM.Top();
    if (frame.pInEntry == frame.pEntryEnd) {
        frame.pInEntry = nullptr;
        DropName(std::exchange(frame.pName, nullptr));
        return true;
    }
    Item item;
    if (!ReadItem(frame.pInEntry, frame.pEntryEnd, item)) return false;
    if (item.tag == wireformat::valueTagG) return StoreValue(item.begin, item.end);
    return item.tag == wireformat::nameTagG;  // a second name is passed over
}

/// Stores a text under the name, or opens the dictionary that is to be stored there.
bool AnyDictDecoder::StoreValue(const unsigned char* begin, const unsigned char* end) {
    if (begin == end || *begin != wireformat::textTagG) {
        const ref<Dict> dict = NewDict();
        if (dict == nullptr) return false;
        Push(dict, begin, end);
        return true;
    }
    RoxString text;
    const Frame& frame = stackM.Top();
    return ReadText(begin, end, text) && frame.pDict->AddString(RoxString(frame.pName), text);
}

bool AnyDictDecoder::CloseBody() {
    const ref<Dict> dict(stackM.Top().pDict);
    PopFrame();
    if (stackM.FEmpty()) return true;
    const Frame& outer = stackM.Top();
    return outer.pDict->AddDict(RoxString(outer.pName), dict);
}

void AnyDictDecoder::Push(const ref<Dict>& dict, const unsigned char* begin, const unsigned char* end) {
    dict->UpRef();
    stackM.Push({dict.get(), nullptr, nullptr, nullptr, begin, end});
}

void AnyDictDecoder::PopFrame() {
    const Frame frame = stackM.Top();
    stackM.Pop();
    DropName(frame.pName);
    RoxCore::DownRef(frame.pDict);
}

ref<Dict> AnyDictDecoder::NewDict() {
    if (!budgetM.TakeBytes(dictionaryBytesG)) return nullptr;
    return MakeDict(pMempoolM);
}

/// Reads a tag, which is one byte here, and a length; false when the item does not fit before `end`.
bool AnyDictDecoder::ReadItem(const unsigned char*& p, const unsigned char* end, Item& item) {
    if (p == end) return false;
    const unsigned char tag = *p;
    uint32_t nBytes = 0;
    const unsigned char* const begin = varint::Read(p + 1, end, nBytes);
    if (begin == nullptr || nBytes > static_cast<size_t>(end - begin)) return false;
    item = {tag, begin, begin + nBytes};
    p = item.end;
    return true;
}

/// Reads a range that one text item fills.
bool AnyDictDecoder::ReadText(const unsigned char* begin, const unsigned char* end, RoxString& text) const {
    Item item;
    if (!ReadItem(begin, end, item) || item.end != end) return false;
    text = RoxString::FromUtf8Bytes(pMempoolM, static_cast<unsigned>(item.end - item.begin), item.begin);
    return true;
}

}  // namespace sorn
