#pragma once

#include <string>
#include <string_view>

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/dict/DictValue.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/model/OrvoVersion.h"
#include "sorn/model/SornObject.h"

/// What comes out, as plain bytes to compare.

std::string_view View(const ref<rox::ByteBuffer>& bytes);
/// A value's text, by way of a byte buffer.
std::string DictionaryText(const sorn::DictValue& value, RoxMempool* pool, bool isPretty = false);
/// A record's text by the typed writer.
std::string TypedText(const sorn::SornObject& object, RoxMempool* pool,
                      sorn::OrvoVersion version = sorn::OrvoVersion());
/// A record's known-dict value.
std::string BinaryForm(const sorn::SornObject& object, RoxMempool* pool);

/// Writes a record in every form, at versions old and new, for the harm alone that it may do.
void WriteEverywhere(const sorn::SornObject& object, RoxMempool* pool);

/// Whether a text has what its writers write and its readers do not take back as it was: a backslash before a
/// `u`, which the typed reader drops and which yajl decodes, and the two control bytes that stay raw.
bool FBrittle(std::string_view text);
