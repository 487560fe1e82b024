#pragma once

#include <gtest/gtest.h>

#include <string>

#include "rox/RoxMempool.h"
#include "rox/RoxString.h"
#include "rox/ref.h"
#include "rpc/ModelMessage.h"
#include "rpc/ModelReader.h"
#include "sorn/dict/Dict.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sorn/rpc/OrvoRpcWrapper.h"

namespace sorntest {

/// A test over a pool of its own, which must be empty at the end, with ways between texts, the model's
/// messages and the library's.
class FramingFixture : public testing::Test {
 protected:
    void TearDown() override { EXPECT_EQ(pool.GetUsedBytes(), 0u) << "bytes left in the pool"; }

    RoxString Text(const std::string& text) { return TextIn(&pool, text); }
    static RoxString TextIn(RoxMempool* pool, const std::string& text) {
        return RoxString::FromUtf8Bytes(pool, static_cast<unsigned>(text.size()), text.data());
    }
    static std::string Str(const RoxString& text) { return std::string(text.View()); }
    static std::string Str(const rox::ByteBuffer& bytes);
    ref<rox::ByteBuffer> Bytes(const std::string& text);

    ref<sorn::Dict> DictOf(const ModelHeaders& headers);
    /// A body of JSON text; null for no text.
    ref<sorn::LazyDict> BodyOf(const std::string& json, int version = 0);
    /// The library's message, its optional headers unfiltered as through a constructor.
    ref<sorn::OrvoRpcWrapper> Wrap(const ModelMessage& message);
    /// What a message of the library says; its body as the text that it keeps, or as compact text.
    static ModelMessage Look(sorn::OrvoRpcWrapper& wrapper);

    /// The message by those marshalling operations that fill a byte buffer, or its words.
    std::string Written(const ref<sorn::OrvoRpcWrapper>& wrapper, const char* wordsBefore = "");

    // What reading a text, and its bytes in a buffer, gives: the message on lines with "read: " in front, or
    // "refused: " and the string for the words as it is then.
    std::string ByLibrary(const std::string& input, bool isBodyParsed = false, const char* wordsBefore = "");
    std::string ByModel(const std::string& input, bool isBodyParsed = false, const char* wordsBefore = "");

    RoxMempool pool{"framing"};
};

/// A message of the given header lines, each without its end, and the body, with a right first line.
std::string Framed(const std::vector<std::string>& vLines, const std::string& body = "");

}  // namespace sorntest
