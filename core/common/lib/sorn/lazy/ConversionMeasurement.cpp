#include "sorn/lazy/ConversionMeasurement.h"

#include <cstring>

#include "rox/RoxLogger.h"
#include "rox/RoxMempool.h"
#include "rox/RoxMonotonicTime.h"
#include "rox/RoxTime.h"
#include "sorn/model/SornObject.h"

namespace sorn {

ConversionMeasurement::ConversionMeasurement(const char* label, const RoxMempool* pool)
    : labelM(label), pMempoolM(pool), beforeM(FiguresOf(pool)), startM(RoxMonotonicTime::Now()) {}

void ConversionMeasurement::End(const SornObject* object, size_t nInputBytes) const {
    const int64_t tocks = RoxMonotonicTime::Now() - startM;
    const PoolFigures after = FiguresOf(pMempoolM);
    if (object == nullptr) return;
    const RoxString typeName = object->GetTypeName();
    if (std::strcmp(typeName.Utf8(), "channelMapConfigInstructions") != 0) return;
    const RoxTime elapsed(RoxMonotonicTime::ToNanoseconds(tocks));
    RoxLogger::Log(
        0, 6, "LazyDict",
        "ToSornObject %s <%s> %zd %s usedBytes (%zd/%zd) highWater (%zd/%zd) elapsedTime %s", labelM,
        typeName.Utf8(), static_cast<ssize_t>(nInputBytes),
        pMempoolM != nullptr ? pMempoolM->GetName() : "heap", static_cast<ssize_t>(beforeM.usedBytes / 1000),
        static_cast<ssize_t>(after.usedBytes / 1000), static_cast<ssize_t>(beforeM.highWater / 1000),
        static_cast<ssize_t>(after.highWater / 1000), elapsed.DebugStringAsInterval().Utf8());
}

ConversionMeasurement::PoolFigures ConversionMeasurement::FiguresOf(const RoxMempool* pool) {
    if (pool == nullptr) return {};
    return {pool->GetUsedBytes(), pool->GetUsedBytesHighWater()};
}

}  // namespace sorn
