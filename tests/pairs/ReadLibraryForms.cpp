#include "convert/RawText.h"
#include "kelbaselib/Bytesource.h"
#include "pairs/LibraryForms.h"
#include "rox/RoxArray.h"
#include "rox/RoxGenericArray.h"
#include "rox/RoxGenericIntArray.h"
#include "rox/RoxStringArray.h"
#include "rox/VkCast.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/NullValue.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/dict/StringValue.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"

namespace sorntest {

using namespace sorn;

namespace {

std::string TextOf(const RoxString& text) {
    return std::string(text.View());
}

Value ReadNumber(const FieldInfo& field, const void* p) {
    Value value;
    const char* bytes = static_cast<const char*>(p);
    switch (field.dataType) {
        case 0:
            value.number = Read<unsigned char>(p);
            break;
        case 2:
            value.number = Read<int32_t>(p);
            value.sub = Read<int32_t>(bytes + 4);
            break;
        case 3:
            value.number = Read<int32_t>(p);
            value.text = std::string(bytes + 4, bytes[4] == 0 ? 0 : 3);
            break;
        case 8:
            value.real = Read<double>(p);
            break;
        case 5:
        case 10:
        case 15:
        case 20:
            value.number = Read<int64_t>(p);
            break;
        case 4:
        case 16:
        case 18:
            value.number = Read<int32_t>(p);
            break;
        default:
            value.number = Read<uint32_t>(p);
    }
    return value;
}

Value ReadReference(const FieldInfo& field, RoxCore* core) {
    Value value;
    value.isNullBytes = core == nullptr && field.dataType == 1;
    if (core == nullptr) return value;
    switch (field.dataType) {
        case 1:
            value.text = BytesOf(static_cast<rox::ByteBuffer*>(core));
            break;
        case 6:
            value.tree = std::make_shared<Tree>(TreeOfDictionary(*static_cast<Dict*>(core)->GetDictionary()));
            break;
        case 13:
            value.body = std::make_shared<Body>(BodyOfLazy(*static_cast<LazyDict*>(core)));
            break;
        default:
            value.record = std::make_shared<Record>(RecordOfObject(*static_cast<SornObject*>(core)));
    }
    return value;
}

std::vector<Value> ReadMember(const FieldInfo& field, const void* member) {
    std::vector<Value> values;
    bool isMulti = field.arity == 2;
    if (field.dataType == 11 || field.dataType == 17) {
        const RoxString* texts = static_cast<const RoxString*>(member);
        unsigned n = 1;
        if (isMulti) {
            n = static_cast<const RoxStringArray*>(member)->GetCount();
            texts = static_cast<const RoxStringArray*>(member)->GetData();
        }
        for (unsigned i = 0; i < n; ++i) {
            values.emplace_back();
            values.back().text = TextOf(texts[i]);
        }
    } else if (FReference(field) && isMulti) {
        const RoxGenericArray& array = *static_cast<const RoxGenericArray*>(member);
        for (unsigned i = 0; i < array.GetCount(); ++i) values.push_back(ReadReference(field, array.At(i)));
    } else if (FReference(field)) {
        RoxCore* core = static_cast<const RefBase*>(member)->GetCore();
        if (core != nullptr || field.arity == 1) values.push_back(ReadReference(field, core));
    } else if (isMulti) {
        const RoxGenericIntArray& array = *static_cast<const RoxGenericIntArray*>(member);
        for (unsigned i = 0; i < array.GetCount(); ++i) values.push_back(ReadNumber(field, array.At(i)));
    } else {
        values.push_back(ReadNumber(field, member));
    }
    return values;
}

Tree TreeOfValue(const ref<DictValue>& value) {
    if (auto* text = VkCast<StringValue>(value))
        return Tree::Text(TextOf(text->GetValue()), text->FNeedQuotes());
    if (VkCast<NullValue>(value) != nullptr) return Tree::Null();
    if (auto* dictionary = VkCast<Dictionary>(value)) return TreeOfDictionary(*dictionary);
    if (auto* lazy = VkCast<LazyDictValue>(value)) {
        return Tree::OfBody(std::make_shared<Body>(BodyOfLazy(*lazy->GetValue())));
    }
    Tree array = Tree::Array();
    auto* values = VkCast<ArrayValue>(value);
    for (unsigned i = 0; i < values->CountValues(); ++i)
        array.items.push_back(TreeOfValue(values->GetValueAt(i)));
    return array;
}

}  // namespace

std::string BytesOf(const ref<rox::ByteBuffer>& bytes) {
    if (bytes == nullptr || bytes->FEmpty()) return "";
    return std::string(reinterpret_cast<const char*>(bytes->GetData()), bytes->GetLength());
}

Record RecordOfObject(const SornObject& object) {
    Record record(*Schema::FindStruct(object.structId));
    for (const FieldKey& key : Record::KeysOf(*record.info)) {
        const FieldInfo& field = record.FieldOf(key);
        const char* start = reinterpret_cast<const char*>(&object);
        if (field.arity == 0 && field.presenceOffset != 0 && start[field.presenceOffset] == 0) continue;
        std::vector<Value> values = ReadMember(field, start + field.storageOffset);
        if (!values.empty()) record.fields[key] = values;
    }
    return record;
}

Tree TreeOfDictionary(const Dictionary& dictionary) {
    Tree tree;
    RoxStringArray names;
    dictionary.GetSortedNames(names);
    for (unsigned i = 0; i < names.GetCount(); ++i) {
        RoxArray<DictValue> values(nullptr);
        dictionary.GetRange(names.At(i), values);
        for (unsigned j = 0; j < values.GetCount(); ++j) {
            tree.Add(TextOf(names.At(i)), TreeOfValue(ref<DictValue>(values.At(j))));
        }
    }
    return tree;
}

Body BodyOfLazy(const LazyDict& lazy) {
    Body body;
    body.rep = static_cast<Body::Rep>(lazy.GetRep());
    body.version = lazy.GetVersion().Number();
    switch (body.rep) {
        case Body::ofObject:
            body.record = std::make_shared<Record>(RecordOfObject(*lazy.GetStoredObject()));
            break;
        case Body::ofDict:
            body.tree = std::make_shared<Tree>(TreeOfDictionary(*lazy.GetStoredDict()->GetDictionary()));
            break;
        case Body::ofDictionary:
            body.tree = std::make_shared<Tree>(TreeOfDictionary(*lazy.GetStoredDictionary()));
            break;
        case Body::ofStream: {
            kelbaselib::Bytesource* source = lazy.GetStoredBytesource()->NewSource();
            char buffer[256];
            while (unsigned n = source->Read(buffer, sizeof buffer)) body.bytes.append(buffer, n);
            source->Release();
            break;
        }
        default:
            body.bytes = BytesOf(lazy.GetStoredBytes());
    }
    return body;
}

}  // namespace sorntest
