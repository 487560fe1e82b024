#include "convert/ShowField.h"

#include <cinttypes>
#include <cstring>

#include "convert/RawText.h"
#include "rox/RoxGenericArray.h"
#include "rox/RoxGenericIntArray.h"
#include "rox/RoxStringArray.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"

namespace sorntest {

using namespace sorn;

namespace {

std::string ShowPlain(const FieldInfo& field, const void* p) {
    switch (field.dataType) {
        case 0:
            return Read<unsigned char>(p) == 1 ? "true" : Read<unsigned char>(p) == 0 ? "false" : "bad bool";
        case 2:
            return Format("%" PRId32 "/%" PRId32, Read<int32_t>(p),
                          Read<int32_t>(static_cast<const char*>(p) + 4));
        case 3:
            return Format("%.4s/%" PRId32, static_cast<const char*>(p) + 4, Read<int32_t>(p));
        case 8:
            return Format("%.17g", Read<double>(p));
        case 4:
        case 16:
        case 18:
            return Format("%" PRId32, Read<int32_t>(p));
        case 7:
        case 9:
        case 19:
            return Format("%" PRIu32, Read<uint32_t>(p));
        case 5:
        case 15:
            return Format("%" PRId64, Read<int64_t>(p));
        default:
            return Format("%" PRIu64, Read<uint64_t>(p));
    }
}

std::string ShowReference(const FieldInfo& field, RoxCore* core) {
    if (core == nullptr) return "null";
    switch (field.dataType) {
        case 1: {
            std::string hex = "bytes ";
            const rox::ByteBuffer& bytes = static_cast<rox::ByteBuffer&>(*core);
            for (unsigned i = 0; i < bytes.GetLength(); ++i) hex += Format("%02x", bytes.GetData()[i]);
            return hex;
        }
        case 6:
            return std::string("dict ") + static_cast<Dict*>(core)->ToString(false).Utf8();
        case 13: {
            const LazyDict& lazy = static_cast<LazyDict&>(*core);
            return Format("lazy %d at %d", lazy.GetRep(), lazy.GetVersion().Number());
        }
        default:
            return std::string("object ") + static_cast<SornObject*>(core)->ToString(false, 0).Utf8();
    }
}

}  // namespace

std::vector<std::string> ShowField(const SornObject& object, const FieldInfo& field) {
    const void* member = reinterpret_cast<const char*>(&object) + field.storageOffset;
    bool isMulti = field.arity == 2;
    std::vector<std::string> shown;
    switch (field.dataType) {
        case 11:
        case 17:
            if (isMulti) {
                const RoxStringArray& array = *static_cast<const RoxStringArray*>(member);
                for (unsigned i = 0; i < array.GetCount(); ++i)
                    shown.push_back("'" + std::string(array.At(i).View()));
            } else {
                shown.push_back("'" + std::string(static_cast<const RoxString*>(member)->View()));
            }
            break;
        case 1:
        case 6:
        case 12:
        case 13:
        case 14:
            if (isMulti) {
                const RoxGenericArray& array = *static_cast<const RoxGenericArray*>(member);
                for (unsigned i = 0; i < array.GetCount(); ++i)
                    shown.push_back(ShowReference(field, array.At(i)));
            } else {
                shown.push_back(ShowReference(field, Read<RoxCore*>(member)));
            }
            break;
        default:
            if (isMulti) {
                const RoxGenericIntArray& array = *static_cast<const RoxGenericIntArray*>(member);
                for (unsigned i = 0; i < array.GetCount(); ++i)
                    shown.push_back(ShowPlain(field, array.At(i)));
            } else {
                shown.push_back(ShowPlain(field, member));
            }
    }
    return shown;
}

}  // namespace sorntest
