// The reader of typed text in memory. Invariants 1 to 4, 6 to 9 and 14.
//
// A refusal leaves a null result; what is accepted is written in every form, and its typed text is read to a
// record of the same text.
#include "fuzz/support/Check.h"
#include "fuzz/support/FuzzPool.h"
#include "fuzz/support/Texts.h"
#include "fuzz/support/TypedRead.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FuzzPool pool;
    const TypedRead read = TypedRead::OfMemory(data, size, pool.Get());
    if (!read.isGood) return 0;
    CheckTypedTextComesBack(read.record, pool.Get());
    WriteEverywhere(*read.record, pool.Get());
    return 0;
}
