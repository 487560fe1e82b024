#pragma once

#include "rox/ref.h"
#include "sorn/model/SornObject.h"

/// What a record holds that its text tells in another way than its reader takes it, or that the roads read
/// differently. docs/formats.md says what and why.
struct RecordContents {
    bool hasAnyDict = false;  ///< any-dict values
    bool hasNestedAnyDict =
        false;             ///< of them one with a map inside: it puts the numbering of objects out of step
    bool hasLazy = false;  ///< lazy bodies
    bool hasUnreadableLazy = false;  ///< of them one that does not convert: it writes nothing
    bool hasNullElement = false;     ///< null among the elements of a repeated field: it is left out
    bool hasForeignObject = false;   ///< an object of another struct than its field declares
    bool hasTypeField = false;       ///< a struct with a field of its own under the name "type"
    bool hasUnreadableScalar =
        false;  ///< a channel or an amount whose text no reader takes, such as "invalid"

    /// Of a record and of all objects in it, those inside lazy bodies included for unreadable scalars alone.
    static RecordContents Of(const ref<sorn::SornObject>& record);
};
