#pragma once

#include <cstdint>
#include <cstring>
#include <string_view>

#include "sorn/model/StructInfo.h"
#include "sorn/typedjson/TextValue.h"

namespace sorn {

/// Finds structs by name, and remembers the ones that it found lately: in a list one name comes all the time.
class StructNames {
 public:
    /// The struct, or null.
    const StructInfo* Find(std::string_view name) {
        if (name.empty()) return nullptr;
        Known& known = knownM[(name.size() * 5 + static_cast<unsigned char>(name[0])) % nKnownG];
        if (known.nName != name.size() || memcmp(known.pInfo->name, name.data(), name.size()) != 0) {
            const StructInfo* const info = textvalue::StructOf(name);
            if (info == nullptr) return nullptr;
            known = {info, name.size()};
        }
        return known.pInfo;
    }

 private:
    static constexpr unsigned nKnownG = 16;

    struct Known {
        const StructInfo* pInfo;
        size_t nName;  ///< 0: nothing is known
    };

    Known knownM[nKnownG] = {};
};

}  // namespace sorn
