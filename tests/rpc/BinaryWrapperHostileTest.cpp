// Truncated, flipped, lying and random messages, in blocks of exactly their size, against a second reader.
// Invariants for untrusted input: 1, 2, 4, 8, 9.

#include <random>
#include <set>
#include <string>
#include <vector>

#include "rpc/BinaryWrapperFixture.h"
#include "rpc/BinaryWrapperModel.h"
#include "sornschema/EveryTypeCompanion.h"
#include "support/SmallStack.h"

namespace sorntest {

using namespace sorn;

class BinaryWrapperHostileTest : public BinaryWrapperFixture {
 protected:
    void SetUp() override { testing::internal::CaptureStdout(); }  // lines about unknown fields
    void TearDown() override {
        testing::internal::GetCapturedStdout();
        BinaryWrapperFixture::TearDown();
    }
    BinaryWrapperModel Model() {
        BinaryWrapperModel model;
        model.body = [this](const std::string& bytes) {
            const ExactBytes exact(bytes);
            const unsigned char* cursor = exact.Begin();
            ref<SornObject> object;
            if (!Codec().UnmarshalKnownDictValue(&cursor, exact.End(), &object)) return std::string();
            return ShownObject(object);
        };
        model.record = [this](const std::string& bytes) {
            const ExactBytes exact(bytes);
            ref<SornObject> object;
            if (!Codec().UnmarshalKnownDict(exact.Begin(), exact.Size(), &object)) return std::string();
            return Shown(object);
        };
        return model;
    }
    /// Good messages of all kinds.
    static std::vector<std::string> Messages() {
        const std::string body = std::string("12 09 ") + bodyG;
        return {Message(requestTagG, Bytes("08 01 " + body + "18 0A 20 34 28 96 01 30 01")),
                Message(requestTagG,
                        Bytes("18 FE FF FF FF 0F " + body + "28 FF FF FF FF FF FF FF FF FF 01 20 54")),
                Message(requestTagG, Bytes(emptyBodyFieldG)),
                Message(responseTagG, Bytes("08 01 " + body + "18 0A")),
                Message(responseTagG, Bytes("18 0A 12 02 0A 00")),
                Bytes("F2 3C 0E 08 0A 12 0A 22 08 32 01 41 42 03 12 01 31"),
                Bytes("CA 5A 07 0A 01 61 0A 02 62 63")};
    }
    void ExpectAsTheModel(const std::string& bytes) {
        EXPECT_EQ(Read(bytes), Model().Read(bytes)) << Hex(bytes);
    }
};

TEST_F(BinaryWrapperHostileTest, TheModelReadsGoodMessages) {
    const std::string body = std::string(" body=") + bodyJsonG;
    const std::vector<std::string> messages = Messages();
    EXPECT_EQ(Model().Read(messages[0]), "request monitor=1 rpcId=5 version=26 partner=150 forget=1" + body);
    EXPECT_EQ(Model().Read(messages[1]),
              "request monitor=0 rpcId=2147483647 version=42 partner=4294967295 forget=-" + body);
    EXPECT_EQ(Model().Read(messages[3]), "response final=1 rpcId=5" + body);
    EXPECT_EQ(Model().Read(messages[4]), "response final=0 rpcId=5 body=error 3: response did not unmarshal");
    for (const std::string& bytes : messages) ExpectAsTheModel(bytes);
}

TEST_F(BinaryWrapperHostileTest, TruncatedAtEveryByte) {
    for (const std::string& bytes : Messages()) {
        const bool isOther = bytes[0] == '\xCA' || bytes[0] == '\xF2';
        for (size_t n = 0; n < bytes.size(); ++n) {
            std::string line = isOther ? "error 3: failed to unmarshal" : badLengthG;
            if (n == 2 && !isOther) line = badG;
            if (n < 2) line = "error 3: does not start with valid int";
            EXPECT_EQ(Read(bytes.substr(0, n)), line) << Hex(bytes.substr(0, n));
        }
    }
}

// The same with a length that is right: only between fields, and behind the body, is there a message.
TEST_F(BinaryWrapperHostileTest, FieldsTruncatedAtEveryByte) {
    const std::string fields =
        Bytes(std::string("08 01 12 09 ") + bodyG + "18 8A 01 20 B4 01 28 96 01 30 01");
    const std::set<size_t> ends = {13, 16, 19, 22, 24};
    for (size_t n = 0; n <= fields.size(); ++n) {
        const std::string bytes = Message(requestTagG, fields.substr(0, n));
        EXPECT_EQ(Read(bytes) != badG, ends.count(n) != 0) << n;
        ExpectAsTheModel(bytes);
    }
}

TEST_F(BinaryWrapperHostileTest, EverySingleBitFlipped) {
    for (const std::string& bytes : Messages()) {
        for (size_t bit = 0; bit < 8 * bytes.size(); ++bit) {
            std::string flipped = bytes;
            flipped[bit / 8] = static_cast<char>(flipped[bit / 8] ^ (1 << bit % 8));
            ExpectAsTheModel(flipped);
        }
    }
}

// Each length of a message set to lies: the one of the message, of the body's field, of the body's value and
// of its text.
TEST_F(BinaryWrapperHostileTest, LyingLengths) {
    const std::string fields = Bytes(std::string("12 09 ") + bodyG + "18 0A");
    for (const char* tag : {requestTagG, responseTagG}) {
        const std::string bytes = Message(tag, fields);
        for (const size_t at : {size_t{2}, size_t{4}, size_t{8}, size_t{10}}) {
            const auto right = static_cast<unsigned char>(bytes[at]);
            for (const uint64_t lie :
                 {uint64_t{0}, uint64_t{right} - 1, uint64_t{right} + 1, uint64_t{right} + 2,
                  uint64_t{0x7FFFFFFF}, uint64_t{0x80000000}, uint64_t{0xFFFFFFFF},
                  uint64_t{0xFFFFFFFF} - right, uint64_t{1} << 32}) {
                ExpectAsTheModel(bytes.substr(0, at) + Varint(lie) + bytes.substr(at + 1));
                // And with a length of the message that is right.
                if (at == 2) continue;
                ExpectAsTheModel(
                    Message(tag, fields.substr(0, at - 3) + Varint(lie) + fields.substr(at - 2)));
            }
        }
    }
}

// Fields put together at random, then a few bytes changed.
TEST_F(BinaryWrapperHostileTest, RandomMessages) {
    std::mt19937 random(20260714);
    const auto below = [&random](unsigned n) { return static_cast<unsigned>(random() % n); };
    const std::vector<std::string> vPieces = {Bytes("08 00"),
                                              Bytes("08 01"),
                                              Bytes("18 0A"),
                                              Bytes("18 FF FF FF FF 0F"),
                                              Bytes("20 34"),
                                              Bytes("28 07"),
                                              Bytes("30 01"),
                                              Bytes("30 00"),
                                              Bytes("12 00"),
                                              Bytes(emptyBodyFieldG),
                                              Bytes("3A 00"),
                                              Bytes("12 02 0A 00"),
                                              Bytes("12 06 FA F1 02 00 08 01"),
                                              Bytes(std::string("12 09 ") + bodyG)};
    unsigned nRead = 0;
    for (unsigned i = 0; i < 20000; ++i) {
        std::string fields;
        for (unsigned n = below(8); n != 0; --n)
            fields += vPieces[below(static_cast<unsigned>(vPieces.size()))];
        std::string bytes = Message(below(2) == 0 ? requestTagG : responseTagG, fields);
        for (unsigned n = below(3); n != 0; --n) {
            bytes[below(static_cast<unsigned>(bytes.size()))] = static_cast<char>(below(256));
        }
        const std::string line = Read(bytes);
        ASSERT_EQ(line, Model().Read(bytes)) << Hex(bytes);
        if (line.compare(0, 5, "error") != 0) ++nRead;
    }
    EXPECT_GT(nRead, 2000u);
    EXPECT_LT(nRead, 18000u);
}

TEST_F(BinaryWrapperHostileTest, RandomBytes) {
    std::mt19937 random(4711);
    for (unsigned i = 0; i < 5000; ++i) {
        std::string bytes(random() % 24, '\0');
        for (char& c : bytes) c = static_cast<char>(random() % 256);
        ExpectAsTheModel(bytes);
    }
}

// Objects in objects, as deep as no thread's stack would bear a recursion.
TEST_F(BinaryWrapperHostileTest, DeepBodies) {
    RunOnSmallStack([this] {
        constexpr unsigned nLevels = 100'000;
        // Built from the inside out, backwards: slot 1, 0A, a length and the next one.
        std::string reversed;
        const auto before = [&reversed](const std::string& bytes) {
            reversed.append(bytes.rbegin(), bytes.rend());
        };
        for (unsigned i = 0; i < nLevels; ++i) {
            before(Varint(reversed.size()));
            before(Bytes("0A"));
        }
        const std::string value =
            Bytes("FA F1 02") + Section(std::string(reversed.rbegin(), reversed.rend()));
        for (const char* tag : {requestTagG, responseTagG}) {
            const ExactBytes bytes(Message(tag, Bytes("18 0A 12") + Section(value)));
            const ref<SornObject> message = Codec().UnmarshalWrapper(bytes.Begin(), bytes.Size());
            const ref<LazyDict> body = tag == requestTagG
                                           ? static_cast<sornschema::OrvoRpcRequest&>(*message).request
                                           : static_cast<sornschema::OrvoRpcResponse&>(*message).response;
            unsigned nFound = 0;
            for (const SornObject* p = body->GetStoredObject().get();
                 (p = static_cast<const sornschema::EveryTypeCompanion*>(p)->child.get()) != nullptr;) {
                ++nFound;
            }
            EXPECT_EQ(nFound, nLevels);
        }
    });
}

// More memory than so few bytes may take: the body is refused, and the message is good.
TEST_F(BinaryWrapperHostileTest, ABodyThatWouldTakeTooMuchMemory) {
    // Slot 11, 5A, of an everyType is a list of known dicts: of empty everyTypes, 8A F2 02, which are the
    // largest records.
    std::string list;
    for (unsigned i = 0; i < 65535; ++i) list += Bytes("5A 04 8A F2 02 00");
    // Slot 35, 9A 02, has another everyType with such a list.
    const std::string value = Bytes("8A F2 02") + Section(Bytes("9A 02") + Section(list) + list);
    EXPECT_EQ(
        Read(Message(requestTagG, Bytes("18 0A 12") + Section(value))),
        "request monitor=0 rpcId=5 version=0 partner=- forget=- body=error 3: request did not unmarshal");
}

}  // namespace sorntest
