#pragma once

#include <string>

#include "fuzz/support/PiecedInput.h"
#include "rox/ref.h"
#include "sorn/model/SornObject.h"

/// What the typed reader made of a text.
struct TypedRead {
    bool isGood = false;
    ref<sorn::SornObject> record;  ///< null unless good: checked
    std::string words;
    unsigned nRead = 0;  ///< bytes taken from a source

    static TypedRead OfMemory(const void* text, size_t n, RoxMempool* pool);
    /// From a source that gives the input's text in its pieces. That the sources are released, and that the
    /// bytes read are those which the first one gave, is checked.
    static TypedRead OfSource(const PiecedInput& input, RoxMempool* pool);
    /// From a stream that has the text in memory, whose bytes the reader takes as they lie there.
    static TypedRead OfMemoryStream(const void* text, size_t n, RoxMempool* pool);
};

/// Checks that a record's typed text, read and written again, is what it was, as far as that holds: the cases
/// that docs/formats.md excepts are left out.
void CheckTypedTextComesBack(const ref<sorn::SornObject>& record, RoxMempool* pool);
