#include "service/Conditions.h"

#include <algorithm>
#include <cstring>
#include <tuple>

#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"
#include "sorn/model/Schema.h"

namespace sorn::service {

namespace {

bool FHasText(DataType type) {
    return type == SORN_DATA_TYPE_STRING || type == SORN_DATA_TYPE_STRING_ID ||
           type == SORN_DATA_TYPE_BYTESTRING;
}

bool FComparable(DataType type) {
    return type != SORN_DATA_TYPE_ANY_DICT && type != SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY &&
           type < SORN_DATA_TYPE_NONE;
}

uint64_t Pair(int32_t high, uint32_t low) {
    return uint64_t{static_cast<uint32_t>(high)} << 32 | low;
}

uint64_t Pair(const Currency& money) {
    uint32_t code;
    static_assert(sizeof money.code == sizeof code);
    std::memcpy(&code, money.code, sizeof code);
    return Pair(money.amount, code);
}

/// Equal for equal values; 0.0 and -0.0 are.
uint64_t Bits(double value) {
    const double plain = value == 0 ? 0 : value;
    uint64_t bits;
    std::memcpy(&bits, &plain, sizeof bits);
    return bits;
}

/// A value of a type without text as a number.
uint64_t NumberAt(DataType type, const FieldSource& source, unsigned i) {
    switch (type) {
        case SORN_DATA_TYPE_BOOL:
            return source.PlainAt<unsigned char>(i);
        case SORN_DATA_TYPE_CHANNEL: {
            const auto& channel = source.PlainAt<ChannelNumber>(i);
            return Pair(channel.number, static_cast<uint32_t>(channel.subNumber));
        }
        case SORN_DATA_TYPE_CURRENCY:
            return Pair(source.PlainAt<Currency>(i));
        case SORN_DATA_TYPE_FLOAT:
            return Bits(source.PlainAt<double>(i));
        case SORN_DATA_TYPE_DATETIME:
        case SORN_DATA_TYPE_LONG_ID:
        case SORN_DATA_TYPE_S64:
        case SORN_DATA_TYPE_U64:
            return source.PlainAt<uint64_t>(i);
        default:
            return source.PlainAt<uint32_t>(i);
    }
}

/// A text or bytes; without bytes an empty one.
std::string_view TextAt(DataType type, const FieldSource& source, unsigned i) {
    if (type != SORN_DATA_TYPE_BYTESTRING) return source.TextAt(i).View();
    const auto* const bytes = source.ReferenceAt<rox::ByteBuffer>(i);
    if (bytes == nullptr) return {};
    return {reinterpret_cast<const char*>(bytes->GetData()), bytes->GetLength()};
}

bool FGiven(const FieldInfo& field, const SornObject& object) {
    return field.arity != SORN_ARITY_OPTIONAL || object.FPresent(field);
}

FieldSource SourceOf(const FieldInfo& field, const SornObject& object) {
    return {object.MemberAt(field), field.arity == SORN_ARITY_MULTI};
}

void AppendNumber(std::string& out, uint64_t number) {
    out.append(reinterpret_cast<const char*>(&number), sizeof number);
}

struct AllFields final : Conditions::Fields {
    bool FWanted(const char*) const override { return true; }
};

}  // namespace

void Conditions::Add(const SornObject& query, OrvoVersion version, const StructInfo& record,
                     const Fields& fields) {
    AddFields(query, version, record, fields, true);
}

/// `isWhole`: objects in fields count, too; so this goes one level down and no further.
void Conditions::AddFields(const SornObject& query, OrvoVersion version, const StructInfo& record,
                           const Fields& fields, bool isWhole) {
    const StructInfo& info = *Schema::vStructDefG[query.structId];
    for (int32_t slot = 0; slot < info.nFields; ++slot) {
        const FieldInfo* const field = info.SelectFieldVariant(slot, version);
        if (field == nullptr || !FGiven(*field, query)) continue;
        const char* const name = info.FieldName(*field);
        if (!fields.FWanted(name)) continue;
        for (int32_t own = 0; own < record.nFields; ++own) {
            const FieldInfo& current = record.vFieldInfo[own];
            if (!current.FHole() && std::strcmp(name, record.FieldName(current)) == 0) {
                AddOne(*field, query, version, own, isWhole);
                break;
            }
        }
    }
    // Fields that the record has with another type never match; they are no condition then.
    std::erase_if(vConditionsM, [&record](const Condition& each) {
        const FieldInfo& field = record.vFieldInfo[each.slot];
        return field.Type() != each.type || field.typeRef != each.typeRef;
    });
}

void Conditions::AddOne(const FieldInfo& given, const SornObject& query, OrvoVersion version, int32_t slot,
                        bool isWhole) {
    const DataType type = given.Type();
    if (!FComparable(type)) return;
    const FieldSource source = SourceOf(given, query);
    Condition condition{slot, type, given.typeRef, {}};
    const unsigned count = source.Count(type);
    for (unsigned i = 0; i < count; ++i) {
        Value value;
        if (ReadValue(type, source, i, version, isWhole, value)) {
            condition.vValues.push_back(std::move(value));
        }
    }
    if (!FHoldsObjects(type)) Sort(condition.vValues);
    if (!condition.vValues.empty()) vConditionsM.push_back(std::move(condition));
}

bool Conditions::ReadValue(DataType type, const FieldSource& source, unsigned i, OrvoVersion version,
                           bool isWhole, Value& value) {
    if (FHasText(type)) {
        value.text = TextAt(type, source, i);
        return true;
    }
    if (!FHoldsObjects(type)) {
        value.number = NumberAt(type, source, i);
        return true;
    }
    const auto* const object = source.ReferenceAt<SornObject>(i);
    if (object == nullptr || !isWhole) return false;
    value.number = object->structId;
    value.vOf.emplace_back();
    value.vOf[0].AddFields(*object, version, *Schema::vStructDefG[object->structId], AllFields(), false);
    return true;
}

void Conditions::Sort(std::vector<Value>& vValues) {
    const auto key = [](const Value& value) { return std::tie(value.number, value.text); };
    std::sort(vValues.begin(), vValues.end(),
              [key](const Value& a, const Value& b) { return key(a) < key(b); });
    const auto isSame = [key](const Value& a, const Value& b) { return key(a) == key(b); };
    vValues.erase(std::unique(vValues.begin(), vValues.end(), isSame), vValues.end());
}

bool Conditions::FHas(const std::vector<Value>& vValues, uint64_t number, std::string_view text) {
    const auto isBefore = [number, text](const Value& value) {
        return value.number != number ? value.number < number : value.text < text;
    };
    const auto found = std::partition_point(vValues.begin(), vValues.end(), isBefore);
    return found != vValues.end() && found->number == number && found->text == text;
}

bool Conditions::FHasObject(const std::vector<Value>& vValues, const SornObject* object,
                            OrvoVersion version) {
    return object != nullptr && std::any_of(vValues.begin(), vValues.end(), [&](const Value& value) {
               return object->structId == value.number && value.vOf[0].FMatches(*object, version);
           });
}

bool Conditions::FMeets(const Condition& condition, const FieldInfo& field, const SornObject& record,
                        OrvoVersion version) {
    const DataType type = condition.type;
    if (field.Type() != type || !FGiven(field, record)) return false;
    const FieldSource source = SourceOf(field, record);
    const unsigned count = source.Count(type);
    for (unsigned i = 0; i < count; ++i) {
        const bool isOneOf = FHoldsObjects(type)
                                 ? FHasObject(condition.vValues, source.ReferenceAt<SornObject>(i), version)
                             : FHasText(type) ? FHas(condition.vValues, 0, TextAt(type, source, i))
                                              : FHas(condition.vValues, NumberAt(type, source, i), {});
        if (isOneOf) return true;
    }
    return false;
}

bool Conditions::FMatches(const SornObject& record, OrvoVersion version) const {
    const StructInfo& info = *Schema::vStructDefG[record.structId];
    return std::all_of(vConditionsM.begin(), vConditionsM.end(), [&](const Condition& each) {
        const FieldInfo* const field = info.SelectFieldVariant(each.slot, version);
        return field != nullptr && FMeets(each, *field, record, version);
    });
}

size_t Conditions::CountObjects() const {
    size_t n = 0;
    for (const Condition& each : vConditionsM) n += FHoldsObjects(each.type) ? each.vValues.size() : 0;
    return n;
}

void Conditions::AppendIdentity(std::string& out) const {
    AppendNumber(out, vConditionsM.size());
    for (const Condition& condition : vConditionsM) {
        AppendNumber(out, static_cast<uint64_t>(condition.slot));
        AppendNumber(out, condition.vValues.size());
        for (const Value& value : condition.vValues) {
            AppendNumber(out, value.number);
            AppendNumber(out, value.text.size());
            out += value.text;
            AppendNumber(out, value.vOf.size());
            for (const Conditions& each : value.vOf) each.AppendIdentity(out);
        }
    }
}

}  // namespace sorn::service
