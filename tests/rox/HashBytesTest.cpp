#include "rox/RoxHashBytes.h"

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <set>
#include <string>

#include "rox/RoxSipHash.h"

namespace {

// The key 00 01 02 ... and the input 00 01 02 ... of the algorithm's published test vectors.
constexpr uint64_t k0 = 0x0706050403020100;
constexpr uint64_t k1 = 0x0F0E0D0C0B0A0908;
constexpr unsigned char input[] = {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14};

}  // namespace

TEST(HashBytesTest, SipHash24GivesThePublishedVectors) {
    struct Case {
        size_t n;
        uint64_t hash;
    };
    const Case vCase[] = {
        {0, 0x726FDB47DD0E0E31}, {1, 0x74F839C593DC67FD}, {8, 0x93F5F5799A932462}, {15, 0xA129CA6149BE45E5}};
    for (const Case& c : vCase) {
        EXPECT_EQ(c.hash, (RoxSipHash<2, 4>::Hash64(k0, k1, input, c.n))) << c.n;
    }
}

TEST(HashBytesTest, HalfSipHash24GivesThePublishedVectors) {
    struct Case {
        size_t n;
        uint32_t hash;
    };
    const Case vCase[] = {{0, 0x5B9F35A9}, {1, 0xB85A4727}, {2, 0x03A662FA}, {3, 0x04E7FE8A}};
    for (const Case& c : vCase) {
        EXPECT_EQ(c.hash, (RoxSipHash<2, 4>::Hash32(0x03020100, 0x07060504, input, c.n))) << c.n;
    }
}

TEST(HashBytesTest, EqualBytesGiveEqualHashes) {
    std::string a = "channel";
    std::string b = "xchannel";
    EXPECT_EQ(RoxHashBytes(a.data(), 7), RoxHashBytes(b.data() + 1, 7));
    EXPECT_EQ(RoxHashBytes(nullptr, 0), RoxHashBytes(a.data(), 0));
}

TEST(HashBytesTest, SpreadsNamesThatDifferLittle) {
    std::set<uint32_t> hashes;
    for (int i = 0; i < 10000; ++i) {
        std::string name = "field" + std::to_string(i);
        uint32_t hash = RoxHashBytes(name.data(), name.size());
        EXPECT_NE(0u, hash);
        hashes.insert(hash);
    }
    // 10,000 draws from 2^32: 0.012 collisions expected.
    EXPECT_GE(hashes.size(), 9995u);
}

namespace {

constexpr const char* askVariable = "ROX_TEST_PRINT_HASH";

/// What AsksForTheHash prints in a process of its own; empty where this program cannot run itself (an
/// emulator).
std::string HashOfAnotherProcess() {
    int ends[2];
    EXPECT_EQ(0, pipe(ends));
    pid_t child = fork();
    if (child == 0) {
        dup2(ends[1], STDOUT_FILENO);
        setenv(askVariable, "1", 1);
        execl("/proc/self/exe", "self", "--gtest_filter=HashBytesTest.AsksForTheHash",
              static_cast<char*>(nullptr));
        _exit(127);
    }
    close(ends[1]);
    std::string text;
    char buffer[4096];
    for (ssize_t n; (n = read(ends[0], buffer, sizeof(buffer))) > 0;) {
        text.append(buffer, static_cast<size_t>(n));
    }
    close(ends[0]);
    int status = 0;
    EXPECT_EQ(child, waitpid(child, &status, 0));
    size_t at = text.find("hash=");
    return at == std::string::npos ? std::string() : text.substr(at + 5, 16);
}

}  // namespace

TEST(HashBytesTest, AsksForTheHash) {
    uint32_t a = RoxHashBytes("a", 1);
    uint32_t b = RoxHashBytes("b", 1);
    EXPECT_NE(a, b);
    if (getenv(askVariable) != nullptr) {
        printf("hash=%08x%08x\n", a, b);
    }
}

TEST(HashBytesTest, EachProcessHasItsOwnKey) {
    std::string one = HashOfAnotherProcess();
    if (one.empty()) {
        GTEST_SKIP() << "this program cannot run itself";
    }
    EXPECT_EQ(16u, one.size());
    EXPECT_NE(one, HashOfAnotherProcess());
}
