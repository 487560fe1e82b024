#include "sorn/rpc/ReservedHeaders.h"

#include <algorithm>
#include <charconv>
#include <cstring>

#include "rox/RoxStringArray.h"

namespace sorn {

void ReservedHeaders::AddNumber(const char* name, uint32_t value) {
    char* const digits = vDigitsM[nLinesM];
    const char* const end = std::to_chars(digits, digits + nDigitsG, value).ptr;
    Add(name, {digits, static_cast<size_t>(end - digits)});
}

void ReservedHeaders::Sort() {
    std::sort(vLinesM, vLinesM + nLinesM,
              [](const Line& a, const Line& b) { return strcmp(a.name, b.name) < 0; });
}

ref<Dict> ReservedHeaders::ToDict(RoxMempool* pool, const Dict* optionalHeaders) const {
    ref<Dict> dict = MakeDict(pool);
    for (unsigned i = 0; i < nLinesM; ++i) {
        const std::string_view value = vLinesM[i].value;
        dict->AddString(RoxString(pool, vLinesM[i].name),
                        RoxString::FromUtf8Bytes(pool, static_cast<unsigned>(value.size()), value.data()));
    }
    if (optionalHeaders == nullptr) return dict;
    RoxStringArray names;
    optionalHeaders->GetSortedNames(names);
    for (unsigned i = 0; i < names.GetCount(); ++i) {
        const unsigned nValues = optionalHeaders->CountValues(names[i]);
        for (unsigned index = 0; index < nValues; ++index) {
            dict->AddString(names[i], optionalHeaders->GetString(names[i], index));
        }
    }
    return dict;
}

}  // namespace sorn
