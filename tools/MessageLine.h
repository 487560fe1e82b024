#pragma once

#include <cstdio>
#include <string>
#include <string_view>

#include "rox/ref.h"
#include "sorn/dict/LazyBody.h"
#include "sorn/rpc/OrvoRpcWrapper.h"

class RoxMempool;

namespace sorn::tools {

/// Writes a message as one JSON object on a line, with the keys that its kind has: "kind", "rpcId",
/// "schemaVersion", "requestType", "responseCount", "isFinal", "contentType", "headers", "body". A header
/// with several values has an array. The body stands as it is; line breaks and feeds in it become blanks, and
/// its exact text follows as "bodyText" then. A body that is no JSON object is a string.
void WriteMessageLine(OrvoRpcWrapper& message, RoxMempool* pool, std::FILE* out);

/// The message of such a line, in the pool; null and words for a person when it is none.
ref<OrvoRpcWrapper> ReadMessageLine(RoxMempool* pool, const std::string& line, std::string& words);

/// Whether a text can stand in a header line, which the first CR, LF ends; the library does not look.
bool FOneLine(std::string_view text);

/// The body of a message of a JSON text at a version: null and words when it does not open with a brace.
ref<LazyDict> NewBody(RoxMempool* pool, std::string_view text, int version, std::string& words);

}  // namespace sorn::tools
