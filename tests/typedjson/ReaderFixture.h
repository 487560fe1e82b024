#pragma once

#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <functional>
#include <string>

#include "kelbaselib/Bytesource.h"
#include "kelbaselib/InMemoryBytestream.h"
#include "rox/RoxMempool.h"
#include "sorn/model/Schema.h"
#include "sorn/typedjson/InputPointerBytesource.h"
#include "sorn/typedjson/JsonSornObject.h"
#include "typedjson/ReadModel.h"

namespace sorntest {

/// A source over a text of the test's that gives at most so many bytes with each read. Counts itself.
class PieceSource final : public kelbaselib::Bytesource {
 public:
    PieceSource(const std::string& text, unsigned nPiece) : textM(text), nPieceM(nPiece) { ++nLiveG; }

    unsigned Read(void* buffer, unsigned capacity) override {
        ++nReadG;
        const size_t n = std::min<size_t>({textM.size() - positionM, nPieceM, capacity});
        memcpy(buffer, textM.data() + positionM, n);
        positionM += n;
        return static_cast<unsigned>(n);
    }
    kelbaselib::Bytesource* NewSource() override { return new PieceSource(textM, nPieceM); }
    unsigned GetAvailable() const override { return 0; }
    void Release() override {
        --nLiveG;
        delete this;
    }

    static inline int nLiveG = 0;
    static inline int nReadG = 0;

 private:
    ~PieceSource() override = default;

    const std::string& textM;
    unsigned nPieceM;
    size_t positionM = 0;
};

/// All that a source still gives.
inline std::string RestOf(kelbaselib::Bytesource& source) {
    std::string text;
    char piece[1000];
    while (unsigned n = source.Read(piece, sizeof piece)) text.append(piece, n);
    return text;
}

/// A copy of a text in a heap block of just its size, so that a read behind it is found.
class ExactText {
 public:
    explicit ExactText(const std::string& text)
        : bytesM(static_cast<unsigned char*>(malloc(text.size()))), nByteM(text.size()) {
        memcpy(bytesM, text.data(), text.size());
    }
    ~ExactText() { free(bytesM); }
    ExactText(const ExactText&) = delete;
    ExactText& operator=(const ExactText&) = delete;

    const unsigned char* Bytes() const { return bytesM; }
    unsigned Length() const { return static_cast<unsigned>(nByteM); }

 private:
    unsigned char* bytesM;
    size_t nByteM;
};

/// A test over a pool of its own, which must be as empty at the end as at the start.
class ReaderFixture : public ::testing::Test {
 protected:
    void TearDown() override {
        EXPECT_EQ(pool.GetUsedBytes(), 0u) << "bytes left in the pool";
        EXPECT_EQ(PieceSource::nLiveG, 0) << "sources that were not released";
    }

    /// A read from memory, with words in the caller's string before it.
    ReadOutcome Read(const std::string& text, const std::string& before = "") {
        const ExactText exact(text);
        ref<sorn::SornObject> object = sorn::Schema::FindStruct(140)->Factory(&pool);
        RoxString words(before.c_str());
        sorn::JsonSornObject context(&pool);
        const bool isRead =
            context.JsonToSornObject(exact.Bytes(), static_cast<int>(exact.Length()), 0, &object, words);
        return {isRead, std::string(words.View()), ShowObject(object.get())};
    }
    /// The same from a source that gives nPiece bytes at a time.
    ReadOutcome ReadStream(const std::string& text, unsigned nPiece, const std::string& before = "") {
        PieceSource* const source = new PieceSource(text, nPiece);
        ref<sorn::SornObject> object = sorn::Schema::FindStruct(140)->Factory(&pool);
        RoxString words(before.c_str());
        unsigned bytesRead = 0;
        const bool isRead =
            sorn::JsonSornObject(&pool).JsonToSornObject(source, bytesRead, 0, &object, words);
        EXPECT_LE(bytesRead, text.size());
        source->Release();
        return {isRead, std::string(words.View()), ShowObject(object.get())};
    }
    /// The same from a stream in memory, which takes the bytes that one in blocks takes.
    ReadOutcome ReadInMemory(const std::string& text, const std::string& before = "") {
        kelbaselib::InMemoryBytestream stream(&pool);
        stream.Write(text.data(), static_cast<unsigned>(text.size()));
        ref<sorn::SornObject> object = sorn::Schema::FindStruct(140)->Factory(&pool);
        RoxString words(before.c_str());
        unsigned bytesRead = 0;
        const bool isRead =
            sorn::JsonSornObject(&pool).JsonToSornObject(&stream, bytesRead, 0, &object, words);
        EXPECT_EQ(bytesRead, BytesReadInBlocks(text)) << text.size();
        return {isRead, std::string(words.View()), ShowObject(object.get())};
    }
    unsigned BytesReadInBlocks(const std::string& text) {
        PieceSource* const source = new PieceSource(text, 16384);
        ref<sorn::SornObject> object;
        RoxString words;
        unsigned bytesRead = 0;
        sorn::JsonSornObject(&pool).JsonToSornObject(source, bytesRead, 0, &object, words);
        source->Release();
        return bytesRead;
    }
    ref<sorn::SornObject> Object(const std::string& text) {
        const ExactText exact(text);
        ref<sorn::SornObject> object;
        RoxString words;
        sorn::JsonSornObject context(&pool);
        EXPECT_TRUE(
            context.JsonToSornObject(exact.Bytes(), static_cast<int>(exact.Length()), 0, &object, words))
            << text.substr(0, 200) << ": " << std::string(words.View()).substr(0, 500);
        EXPECT_EQ(words.View(), "");
        return object;
    }
    template <class T>
    ref<T> ObjectOf(const std::string& text) {
        return ref<T>(static_cast<T*>(Object(text).get()));
    }
    /// Does the same with a cursor over the text in memory, and with some that read it in pieces.
    static void WithCursors(const std::string& text,
                            const std::function<void(sorn::InputPointerBytesource&)>& work) {
        {
            const ExactText exact(text);
            sorn::InputPointerBytesource cursor(exact.Bytes(), exact.Length());
            work(cursor);
        }
        {
            SCOPED_TRACE("stream in memory");
            kelbaselib::InMemoryBytestream stream;
            stream.Write(text.data(), static_cast<unsigned>(text.size()));
            kelbaselib::Bytesource* const source = stream.NewSource();
            sorn::InputPointerBytesource cursor = sorn::InputPointerBytesource::Over(source);
            work(cursor);
            source->Release();
        }
        for (unsigned nPiece : {1u, 2u, 3u, 7u, 16384u}) {
            SCOPED_TRACE(nPiece);
            PieceSource* const source = new PieceSource(text, nPiece);
            sorn::InputPointerBytesource cursor(source);
            work(cursor);
            source->Release();
        }
    }

    RoxMempool pool{"typedjson"};
};

inline std::ostream& operator<<(std::ostream& out, const ReadOutcome& outcome) {
    return out << (outcome.isRead ? "read " : "refused ") << '"' << outcome.words << "\" " << outcome.shown;
}

}  // namespace sorntest
