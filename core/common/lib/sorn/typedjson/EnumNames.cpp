#include "sorn/typedjson/EnumNames.h"

#include <algorithm>
#include <new>

#include "rox/RoxMempool.h"
#include "sorn/typedjson/IndexCache.h"

namespace sorn {

namespace {

/// Room for all enumerations of the schema.
constinit IndexCache<EnumDef, EnumNames, 10> cacheG;

/// Ends the indexes with the process.
class EnumNamesDestructor {
 public:
    ~EnumNamesDestructor() { EnumNames::DestroyAll(); }
};

const EnumNamesDestructor destructorG;

}  // namespace

EnumNames::EnumNames(const EnumDef& def, uint32_t nNames) : defM(def), namesM(nNames) {
    for (uint32_t value = 0; value < def.count; ++value) {
        if (def.names[value] != nullptr) namesM.Add(def.names[value], value);
    }
}

EnumNames* EnumNames::New(const EnumDef& def) {
    const auto nNames =
        std::count_if(def.names, def.names + def.count, [](const char* name) { return name != nullptr; });
    void* const memory = RoxMempool::MallocIn(nullptr, sizeof(EnumNames));
    return new (memory) EnumNames(def, static_cast<uint32_t>(nNames));
}

void EnumNames::Delete(EnumNames* names) {
    names->~EnumNames();
    RoxMempool::FreeIn(nullptr, names);
}

bool EnumNames::Find(const EnumDef& def, const NameKey& name, uint32_t& value) {
    const EnumNames* const names = cacheG.Of(def);
    if (names == nullptr) return FindAlone(def, name, value);
    const uint32_t found = names->namesM.Find(name);
    if (found == NameIndex::noneG) return false;
    value = found;
    return true;
}

/// For one enumeration too many.
bool EnumNames::FindAlone(const EnumDef& def, const NameKey& name, uint32_t& value) {
    EnumNames* const names = New(def);
    const uint32_t found = names->namesM.Find(name);
    Delete(names);
    if (found != NameIndex::noneG) value = found;
    return found != NameIndex::noneG;
}

void EnumNames::DestroyAll() {
    cacheG.DestroyAll();
}

}  // namespace sorn
