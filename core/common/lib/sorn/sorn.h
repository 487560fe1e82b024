#pragma once

/// All of the library but the record classes, which are `sornschema/<Record>.h` and `sornschema/all.h`.

#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Base64.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/MempoolNew.h"
#include "sorn/dict/NullValue.h"
#include "sorn/dict/Rox1ByteBufferCore.h"
#include "sorn/dict/StringValue.h"
#include "sorn/dict/TextUtilities.h"
#include "sorn/json/InputPointer.h"
#include "sorn/json/Json.h"
#include "sorn/json/JsonFormat.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/InternedString.h"
#include "sorn/model/Schema.h"
#include "sorn/model/SornObject.h"
#include "sorn/model/StructInfoMap.h"
