#include "sorn/typedjson/EnumTexts.h"

#include <atomic>
#include <new>

#include "rox/RoxMempool.h"

namespace sorn {

namespace {

// All texts, the newest first.
constinit std::atomic<EnumTexts*> pFirstG = nullptr;

/// Bytes of a name's text and its length; 0 without one.
size_t BytesOf(const char* name) {
    if (name == nullptr) return 0;
    const size_t n = std::strlen(name) + 2;
    return n <= EnumTexts::maxTextG ? n + 1 : 0;
}

}  // namespace

EnumTexts* EnumTexts::New(const EnumDef& def) {
    size_t nTexts = nBlockG;
    for (uint32_t value = 0; value < def.count; ++value) nTexts += BytesOf(def.names[value]);
    const size_t nOffsets = def.count * sizeof(uint32_t);
    auto* const block =
        static_cast<unsigned char*>(RoxMempool::CallocIn(nullptr, sizeof(EnumTexts) + nOffsets + nTexts));
    unsigned char* const offsets = block + sizeof(EnumTexts);
    auto* const texts = new (block) EnumTexts(def, reinterpret_cast<uint32_t*>(offsets), offsets + nOffsets);
    texts->Fill();
    return texts;
}

void EnumTexts::Fill() {
    unsigned char* p = pTextsM;
    for (uint32_t value = 0; value < defM.count; ++value) {
        const char* const name = defM.names[value];
        const size_t nBytes = BytesOf(name);
        if (nBytes == 0) continue;
        p[0] = static_cast<unsigned char>(nBytes - 1);
        p[1] = '"';
        std::memcpy(p + 2, name, nBytes - 3);
        p[nBytes - 1] = '"';
        vOffsetM[value] = static_cast<uint32_t>(p + 1 - pTextsM);
        p += nBytes;
    }
}

void EnumTexts::Delete(EnumTexts* texts) {
    texts->~EnumTexts();
    RoxMempool::FreeIn(nullptr, texts);
}

const EnumTexts* EnumTexts::FindTexts(const EnumTexts* first, const EnumDef& def) {
    while (first != nullptr && &first->defM != &def) first = first->pNextM;
    return first;
}

// Two threads may make the same texts at once: one of them puts them in front, the other drops its own.
const EnumTexts* EnumTexts::Of(const EnumDef& def) {
    if (def.count > maxCountG) return nullptr;
    EnumTexts* first = pFirstG.load(std::memory_order_acquire);
    const EnumTexts* found = FindTexts(first, def);
    if (found != nullptr) return found;
    EnumTexts* const texts = New(def);
    do {
        found = FindTexts(first, def);
        if (found != nullptr) {
            Delete(texts);
            return found;
        }
        texts->pNextM = first;
    } while (
        !pFirstG.compare_exchange_weak(first, texts, std::memory_order_acq_rel, std::memory_order_acquire));
    return texts;
}

void EnumTexts::DestroyAll() {
    EnumTexts* texts = pFirstG.exchange(nullptr, std::memory_order_acq_rel);
    while (texts != nullptr) {
        EnumTexts* const next = texts->pNextM;
        Delete(texts);
        texts = next;
    }
}

}  // namespace sorn
