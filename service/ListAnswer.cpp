#include "service/ListAnswer.h"

namespace sorn::service {

namespace {

/// Adds a field if the list has one of that name and type.
void AddField(const StructInfo& list, const char* name, DataType type, const std::string& value,
              std::string& text) {
    const FieldInfo* const field = FindField(list, name, OrvoVersion());
    if (field == nullptr || field->Type() != type || field->arity == SORN_ARITY_MULTI) return;
    text += std::string(", \"") + name + "\": " + value;
}

std::string BoolText(bool value) {
    return value ? "true" : "false";
}

/// The records of a list, joined one by one.
class Joined {
 public:
    Joined(Records& records, const Query& query, size_t maxBytes, std::string& text, Failure& failure)
        : recordsM(records), queryM(query), maxBytesM(maxBytes), textM(text), failureM(failure) {}

    /// Takes the next record that meets the query; false when no more are needed.
    bool Take(int64_t number) {
        if (nLeftOutM < queryM.offset) return ++nLeftOutM != 0;
        isMoreM = nTakenM == queryM.count;
        if (isMoreM) return false;
        isReadM = recordsM.Read(
            number, [this](std::string_view record) { textM.append(nTakenM++ == 0 ? "" : ", ") += record; },
            failureM);
        if (isReadM && textM.size() > maxBytesM) isReadM = FailTooLarge();
        return isReadM;
    }
    bool FailTooLarge() {
        return failureM.Set(ErrorCode::resourceUnavailableG,
                            "the answer is too large: ask for fewer records with count");
    }
    bool FRead() const { return isReadM; }
    bool FMore() const { return isMoreM; }
    uint32_t CountLeftOut() const { return nLeftOutM; }

 private:
    Records& recordsM;
    const Query& queryM;
    const size_t maxBytesM;
    std::string& textM;
    Failure& failureM;
    uint32_t nLeftOutM = 0;
    uint32_t nTakenM = 0;
    bool isMoreM = false;
    bool isReadM = true;
};

}  // namespace

bool WriteList(Records& records, const Query& query, const Limits& limits, std::string& text,
               Failure& failure) {
    const StructInfo& list = *query.pPlan->pList;
    text = std::string("{\"type\": \"") + list.name + "\", \"" + list.FieldName(*query.pPlan->pListRecords) +
           "\": [";
    Joined joined(records, query, limits.maxAnswerBytes, text, failure);
    const auto take = [&joined](int64_t number) { return joined.Take(number); };
    if (!records.Find(*query.pPlan->pRecord, query.conditions, take, failure) || !joined.FRead())
        return false;
    text += "]";
    const uint32_t nLeftOut = joined.CountLeftOut();
    AddField(list, "anchorIndex", SORN_DATA_TYPE_S32, std::to_string(nLeftOut), text);
    AddField(list, "isBottom", SORN_DATA_TYPE_BOOL, BoolText(!joined.FMore()), text);
    AddField(list, "isTop", SORN_DATA_TYPE_BOOL, BoolText(nLeftOut == 0), text);
    text += "}";
    return text.size() <= limits.maxAnswerBytes || joined.FailTooLarge();
}

}  // namespace sorn::service
