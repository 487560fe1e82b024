#pragma once

#include <cstddef>
#include <cstdint>

class RoxMempool;

namespace sorn {

class SornObject;

/// What one conversion of a text to an object took: the time, and the pool's figures before and after.
class ConversionMeasurement {
 public:
    /// Begins. `label` names the road of the conversion; it is kept by pointer, as is the pool, which may be
    /// null for the general heap.
    ConversionMeasurement(const char* label, const RoxMempool* pool);

    /// Ends. Writes one line to the log when the object is a channelMapConfigInstructions; other objects, and
    /// null, write none. `nInputBytes` is the size of the text.
    void End(const SornObject* object, size_t nInputBytes) const;

 private:
    struct PoolFigures {
        size_t usedBytes = 0;
        size_t highWater = 0;
    };
    static PoolFigures FiguresOf(const RoxMempool* pool);

    const char* labelM;
    const RoxMempool* pMempoolM;
    PoolFigures beforeM;
    int64_t startM;
};

}  // namespace sorn
