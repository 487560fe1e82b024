#pragma once

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/json/InputPointer.h"

class RoxMempool;

namespace sorn {

class DictValue;

/// Reads one scalar, behind white space: a text in quotes, or a token, of which "null" gives a NullValue and
/// all others a StringValue without need of quotes, whatever they look like. False, with words in `error` and
/// `out` untouched, for a bad text and for an empty token. The value is made in the pool.
bool ReadScalarValue(InputPointer& cursor, RoxMempool* pool, RoxString& error, ref<DictValue>* out);

}  // namespace sorn
