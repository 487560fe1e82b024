#include "sorn/binary/LazyLevels.h"

#include "sorn/dict/Dictionary.h"

namespace sorn {

ref<Dictionary> NewTooDeepError(RoxMempool* pool) {
    ref<Dictionary> dictionary = Dictionary::New(pool, RoxString(pool, "error"));
    dictionary->Add(RoxString(pool, "code"), RoxString(pool, "badArgument"));
    dictionary->Add(RoxString(pool, "text"), RoxString(pool, "lazy bodies nested too deeply"));
    return dictionary;
}

}  // namespace sorn
