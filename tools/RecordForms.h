#pragma once

#include <cstdio>
#include <string>

#include "rox/ref.h"
#include "sorn/model/SornObject.h"
#include "tools/Convert.h"

class RoxMempool;

namespace sorn::tools {

/// The object of a record in the form and by the road that the options name, made in the pool; null and words
/// for a person when it is refused. With `lines` the bytes of the binary form are Base64 text.
ref<SornObject> ReadRecord(const ConvertOptions& options, RoxMempool* pool, const std::string& record,
                           std::string& words);

/// Writes the object in the form and by the road that the options name. Text, and with `lines` every form,
/// ends with a line feed. Text of the dictionary writer goes out in pieces: pretty text of a deep record is
/// much longer than the record.
void WriteRecord(const ConvertOptions& options, RoxMempool* pool, const ref<SornObject>& object,
                 std::FILE* out);

}  // namespace sorn::tools
