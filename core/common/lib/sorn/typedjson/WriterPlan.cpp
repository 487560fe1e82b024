#include "sorn/typedjson/WriterPlan.h"

#include <algorithm>
#include <new>

#include "rox/RoxMempool.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/model/Schema.h"
#include "sorn/typedjson/EnumTexts.h"

namespace sorn {

namespace {

constexpr char typeNameG[] = "type";

bool FHoldsId(DataType type) {
    return type == SORN_DATA_TYPE_INT_ID || type == SORN_DATA_TYPE_LONG_ID ||
           type == SORN_DATA_TYPE_STRING_ID;
}

/// The prefix of a field's ids when it is short enough for a plan, else null.
const char* ShortPrefix(const FieldInfo& field, StructTable table) {
    if (!FHoldsId(field.Type())) return nullptr;
    const StructInfo* const info = table.Find(field.typeRef);
    if (info == nullptr) return nullptr;
    const char* const prefix = info->idPrefix != nullptr ? info->idPrefix : "";
    return std::strlen(prefix) < WriterPlan::nPrefixBlockG ? prefix : nullptr;
}

unsigned char* Append(const char* text, size_t n, unsigned char* out) {
    std::memcpy(out, text, n);
    return out + n;
}

unsigned char* AppendKey(const char* name, unsigned char* out) {
    out = Append(", \"", 3, out);
    out = Append(name, std::strlen(name), out);
    return Append("\": ", 3, out);
}

constexpr size_t AlignUp(size_t n) {
    return (n + alignof(WriterPlan::Step) - 1) / alignof(WriterPlan::Step) * alignof(WriterPlan::Step);
}

}  // namespace

WriterPlan::Step WriterPlan::StepOf(const FieldInfo& field, bool isMulti) {
    const DataType type = field.Type();
    const FieldStorage storage = StorageOf(type);
    Step step{};
    step.pField = &field;
    step.storageOffset = field.storageOffset;
    if (!isMulti) {
        step.form = type;
        if (storage == FieldStorage::REFERENCE) step.form = SINGLE_REFERENCE;
    } else if (type >= SORN_DATA_TYPE_NONE) {
        step.form = NOTHING;
    } else if (storage == FieldStorage::REFERENCE) {
        step.form = MULTI_REFERENCE;
    } else {
        step.form = storage == FieldStorage::TEXT ? MULTI_TEXT : MULTI_PLAIN;
    }
    return step;
}

// One block: the plan, its steps and groups, the bits of the views, the texts.
WriterPlan* WriterPlan::New(const StructInfo& info, StructTable table) {
    size_t nSteps = 0;
    size_t nTexts = maxKeyG + std::strlen(info.name) + nKeyBlockG + nSeparatorG;
    for (int32_t slot = 0; slot < info.nFields; ++slot) {
        const FieldInfo& field = info.vFieldInfo[slot];
        if (field.FHole()) continue;
        ++nSteps;
        nTexts += std::strlen(info.FieldName(field)) + 6 + nPrefixBlockG;
    }
    const size_t nGroups = (nSteps + nGroupG - 1) / nGroupG;
    const size_t atSteps = AlignUp(sizeof(WriterPlan));
    const size_t atGroups = atSteps + nSteps * sizeof(Step);
    const size_t atHolds = atGroups + nGroups * sizeof(Group);
    const size_t atTexts = atHolds + 2 * nGroups * sizeof(uint32_t);
    auto* const block = static_cast<unsigned char*>(RoxMempool::CallocIn(nullptr, atTexts + nTexts));
    auto* const plan = new (block) WriterPlan(info);
    plan->vStepsM = reinterpret_cast<Step*>(block + atSteps);
    plan->vGroupsM = reinterpret_cast<Group*>(block + atGroups);
    plan->FillSteps(table, block + atTexts);
    plan->FillGroups();
    auto* const vHolds = reinterpret_cast<uint32_t*>(block + atHolds);
    plan->wholeViewM = plan->MakeView(0, vHolds);
    plan->newestM = Schema::lastSchemaVersionG;
    plan->newestViewM = plan->MakeView(plan->newestM, vHolds + nGroups);
    return plan;
}

void WriterPlan::FillSteps(StructTable table, unsigned char* texts) {
    unsigned char* p = texts;
    for (int32_t slot = 0; slot < infoM.nFields; ++slot) {
        const FieldInfo& field = infoM.vFieldInfo[slot];
        if (field.FHole()) continue;
        Step& step = *new (&vStepsM[nStepsM++]) Step(StepOf(field, field.arity == SORN_ARITY_MULTI));
        const char* const name = infoM.FieldName(field);
        if (std::strlen(name) <= maxNameG) {
            step.pKey = p;
            p = AppendKey(name, p);
            step.nKey = static_cast<uint8_t>(p - step.pKey);
        } else {
            step.form = LONG_NAME;
        }
        if (field.Type() == SORN_DATA_TYPE_ENUM) {
            const EnumDef* const def = Schema::FindEnum(field.typeRef);
            step.pTexts = def != nullptr ? EnumTexts::Of(*def) : nullptr;
        } else if (const char* const prefix = ShortPrefix(field, table); prefix != nullptr) {
            step.pPrefix = p;
            step.nPrefix = static_cast<uint8_t>(std::strlen(prefix) + 1);
            Append(prefix, std::strlen(prefix), Append("\"", 1, p));
            p += nPrefixBlockG;
        }
    }
    pTypeEntryM = p;
    p = Append("\"", 1, AppendKey(typeNameG, p));
    p = Append("\"", 1, Append(infoM.name, std::strlen(infoM.name), p));
    nTypeEntryM = static_cast<size_t>(p - pTypeEntryM);
}

void WriterPlan::FillGroups() {
    for (unsigned i = 0; i < nStepsM; ++i) {
        Group& group = vGroupsM[i / nGroupG];
        const unsigned k = i % nGroupG;
        const uint16_t offset = vStepsM[i].pField->presenceOffset;
        group.vPresence[k] = offset;
        group.nPresence = k / nUnrolledG * nUnrolledG + nUnrolledG;
        (offset != 0 ? group.withByte : group.withoutByte) |= uint32_t{1} << k;
    }
}

WriterPlan::View WriterPlan::MakeView(OrvoVersion version, uint32_t* vHolds) const {
    for (unsigned i = 0; i < nStepsM; ++i) {
        if (vStepsM[i].pField->FHoldsIn(version)) vHolds[i / nGroupG] |= uint32_t{1} << i % nGroupG;
    }
    return {vHolds, FindAnchor(version)};
}

unsigned WriterPlan::FindAnchor(OrvoVersion version) const {
    for (unsigned i = nStepsM; i-- > 0;) {
        const FieldInfo& field = *vStepsM[i].pField;
        if (field.FHoldsIn(version) && std::strcmp(infoM.FieldName(field), typeNameG) < 0) return i;
    }
    return nStepsM;
}

void WriterPlan::Delete(WriterPlan* plan) {
    plan->~WriterPlan();
    RoxMempool::FreeIn(nullptr, plan);
}

}  // namespace sorn
