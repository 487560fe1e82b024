// Copies of texts that are looked through meanwhile.
#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>

#include "json/Support.h"
#include "sorn/json/PlainCopy.h"

namespace {

/// Copies from and to blocks of exactly the text's size.
bool CopyExactly(const std::string& text, std::string& copy) {
    const jsontest::ExactBytes from(text);
    const std::unique_ptr<unsigned char[]> to(new unsigned char[text.size()]());
    const bool isPlain =
        sorn::plaincopy::Copy(reinterpret_cast<const char*>(from.Begin()), text.size(), to.get());
    copy.assign(reinterpret_cast<const char*>(to.get()), text.size());
    return isPlain;
}

TEST(PlainCopy, TextsOfEveryLengthThatNeedNoEscape) {
    std::string copy;
    for (size_t n = 0; n <= 140; ++n) {
        std::string text;
        for (size_t i = 0; i < n; ++i) text += static_cast<char>(i % 7 == 3 ? 0x80 + i % 128 : 'a' + i % 26);
        ASSERT_TRUE(CopyExactly(text, copy)) << n;
        ASSERT_EQ(copy, text);
    }
}

TEST(PlainCopy, ABackslashQuoteOrControlByteAtAnyPlace) {
    std::string copy;
    for (const char stop : {'"', '\\', '\0', '\n', '\x1F'}) {
        for (size_t n = 1; n <= 70; ++n) {
            for (size_t place = 0; place < n; ++place) {
                std::string text(n, 'x');
                text[place] = stop;
                ASSERT_FALSE(CopyExactly(text, copy)) << int{stop} << " " << n << " " << place;
            }
        }
    }
}

TEST(PlainCopy, BytesNextToThoseThatNeedAnEscapeNeedNone) {
    std::string copy;
    for (const char plain : {' ', '!', '#', '[', ']', '\x7F', '\xA2', '\xDC', '\xFF'}) {
        for (size_t n = 1; n <= 40; ++n) {
            const std::string text(n, plain);
            ASSERT_TRUE(CopyExactly(text, copy)) << int{plain} << " " << n;
            ASSERT_EQ(copy, text);
        }
    }
}

}  // namespace
