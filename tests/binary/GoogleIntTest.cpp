// Numbers of the binary form. Invariants for untrusted input: 1, 2.

#include "sorn/binary/GoogleInt.h"

#include <climits>

#include "binary/BinaryFixture.h"

namespace sorntest {

using namespace sorn;

namespace {

using Stream = ProtoBufByteOutputStream;

template <class T>
struct Case {
    T value;
    const char* hex;
};

/// Each value is written as the bytes and read from them, with a byte behind that stays.
template <class T, class Write, class Read>
void CheckBothWays(std::initializer_list<Case<T>> cases, Write write, Read read) {
    for (const Case<T>& each : cases) {
        SCOPED_TRACE(each.hex);
        Stream stream;
        write(each.value, stream);
        EXPECT_EQ(Finished(stream), each.hex);
        for (const char* behind : {"", " 01"}) {
            const ExactBytes bytes(Bytes(std::string(each.hex) + behind));
            const unsigned char* cursor = bytes.Begin();
            T value{};
            EXPECT_TRUE(read(&cursor, bytes.End(), &value));
            EXPECT_EQ(value, each.value);
            EXPECT_EQ(cursor, bytes.Begin() + Bytes(each.hex).size());
        }
    }
}

template <class T, class Read>
void CheckRead(std::initializer_list<Case<T>> cases, Read read) {
    for (const Case<T>& each : cases) {
        SCOPED_TRACE(each.hex);
        const ExactBytes bytes(Bytes(each.hex));
        const unsigned char* cursor = bytes.Begin();
        T value{};
        EXPECT_TRUE(read(&cursor, bytes.End(), &value));
        EXPECT_EQ(value, each.value);
        EXPECT_EQ(cursor, bytes.End());
    }
}

template <class T, class Read>
void CheckRefused(std::initializer_list<const char*> cases, Read read) {
    for (const char* hex : cases) {
        SCOPED_TRACE(hex);
        const ExactBytes bytes(Bytes(hex));
        const unsigned char* cursor = bytes.Begin();
        T value = 77;
        EXPECT_FALSE(read(&cursor, bytes.End(), &value));
        EXPECT_EQ(value, T{77});
        EXPECT_EQ(cursor, bytes.Begin());
    }
}

}  // namespace

TEST(GoogleIntTest, U32) {
    CheckBothWays<unsigned>({{0, "00"},
                             {1, "01"},
                             {100, "64"},  // the stream's escape byte
                             {127, "7F"},
                             {128, "80 01"},
                             {300, "AC 02"},
                             {16383, "FF 7F"},
                             {16384, "80 80 01"},
                             {2097151, "FF FF 7F"},
                             {2097152, "80 80 80 01"},
                             {268435455, "FF FF FF 7F"},
                             {268435456, "80 80 80 80 01"},
                             {0x80000000, "80 80 80 80 08"},
                             {0xFFFFFFFF, "FF FF FF FF 0F"}},
                            GoogleInt::WriteGoogleU32, GoogleInt::ReadGoogleU32);
}

TEST(GoogleIntTest, S32) {
    CheckBothWays<int>({{0, "00"},
                        {-1, "01"},
                        {1, "02"},
                        {-2, "03"},
                        {50, "64"},
                        {-64, "7F"},
                        {64, "80 01"},
                        {INT_MAX, "FE FF FF FF 0F"},
                        {INT_MIN, "FF FF FF FF 0F"}},
                       GoogleInt::WriteGoogleS32, GoogleInt::ReadGoogleS32);
}

TEST(GoogleIntTest, U64) {
    CheckBothWays<unsigned long long>({{0, "00"},
                                       {100, "64"},
                                       {0xFFFFFFFF, "FF FF FF FF 0F"},
                                       {1ull << 35, "80 80 80 80 80 01"},
                                       {(1ull << 63) - 1, "FF FF FF FF FF FF FF FF 7F"},
                                       {1ull << 63, "80 80 80 80 80 80 80 80 80 01"},
                                       {ULLONG_MAX, "FF FF FF FF FF FF FF FF FF 01"}},
                                      GoogleInt::WriteGoogleU64, GoogleInt::ReadGoogleU64);
}

TEST(GoogleIntTest, S64) {
    CheckBothWays<long long>({{0, "00"},
                              {-1, "01"},
                              {1, "02"},
                              {-2, "03"},
                              {INT_MIN, "FF FF FF FF 0F"},
                              {LLONG_MAX, "FE FF FF FF FF FF FF FF FF 01"},
                              {LLONG_MIN, "FF FF FF FF FF FF FF FF FF 01"}},
                             GoogleInt::WriteGoogleS64, GoogleInt::ReadGoogleS64);
}

TEST(GoogleIntTest, LongerFormsAndExcessBits) {
    CheckRead<unsigned>({{0, "80 00"},
                         {0, "80 80 80 80 00"},
                         {1, "81 80 00"},
                         {0xFFFFFFFF, "FF FF FF FF 7F"},
                         {0xFFFFFFFF, "FF FF FF FF 1F"},
                         {0xF0000000, "80 80 80 80 7F"}},
                        GoogleInt::ReadGoogleU32);
    CheckRead<int>({{INT_MIN, "FF FF FF FF 7F"}, {-1, "81 00"}}, GoogleInt::ReadGoogleS32);
    CheckRead<unsigned long long>({{0, "80 00"},
                                   {0, "80 80 80 80 80 80 80 80 80 00"},
                                   {ULLONG_MAX, "FF FF FF FF FF FF FF FF FF 7F"},
                                   {0, "80 80 80 80 80 80 80 80 80 7E"}},
                                  GoogleInt::ReadGoogleU64);
    CheckRead<long long>({{LLONG_MIN, "FF FF FF FF FF FF FF FF FF 7F"}}, GoogleInt::ReadGoogleS64);
}

TEST(GoogleIntTest, Refused) {
    CheckRefused<unsigned>({"", "80", "FF FF FF FF", "FF FF FF FF FF 01", "80 80 80 80 80 00",
                            "80 80 80 80 80 80 80 80 80 80 80 80 01", "80 80 80 80 80 80 80"},
                           GoogleInt::ReadGoogleU32);
    CheckRefused<int>({"", "80", "FF FF FF FF FF 01"}, GoogleInt::ReadGoogleS32);
    CheckRefused<unsigned long long>(
        {"", "80", "FF FF FF FF FF FF FF FF FF", "80 80 80 80 80 80 80 80 80 80 01"},
        GoogleInt::ReadGoogleU64);
    CheckRefused<long long>({"", "80", "80 80 80 80 80 80 80 80 80 80 01"}, GoogleInt::ReadGoogleS64);
}

}  // namespace sorntest
