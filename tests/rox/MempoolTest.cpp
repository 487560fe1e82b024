#include "rox/RoxMempool.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "Random.h"
#include "rox/RoxMempoolPoison.h"

namespace {

using roxmempool::fPoisoning;

struct ClassCase {
    size_t requested;
    size_t used;
};

// Worked out by hand: multiples of 8 to 128, of 16 to 256, four to each doubling to 16,384, then pages of
// 4,096 less the 64 bytes in front of a large block.
constexpr ClassCase vClassCase[] = {
    {0, 8},
    {1, 8},
    {8, 8},
    {9, 16},
    {17, 24},
    {25, 32},
    {120, 120},
    {121, 128},
    {128, 128},
    {129, 144},
    {144, 144},
    {145, 160},
    {241, 256},
    {256, 256},
    {257, 320},
    {320, 320},
    {321, 384},
    {385, 448},
    {449, 512},
    {512, 512},
    {513, 640},
    {641, 768},
    {769, 896},
    {1024, 1024},
    {1025, 1280},
    {1281, 1536},
    {1792, 1792},
    {1793, 2048},
    {2049, 2560},
    {3073, 3584},
    {4096, 4096},
    {4097, 5120},
    {8192, 8192},
    {8193, 10240},
    {12288, 12288},
    {12289, 14336},
    {14337, 16384},
    {16384, 16384},
    {16385, 20416},
    {20416, 20416},
    {20417, 24512},
    {1000000, 1003456},
    {5242880, 5246912},
};

void Fill(void* p, size_t n, unsigned seed) {
    unsigned char* bytes = static_cast<unsigned char*>(p);
    for (size_t i = 0; i < n; ++i) {
        bytes[i] = static_cast<unsigned char>(seed * 31 + i * 7 + (i >> 8));
    }
}

bool FFilled(const void* p, size_t n, unsigned seed) {
    const unsigned char* bytes = static_cast<const unsigned char*>(p);
    for (size_t i = 0; i < n; ++i) {
        if (bytes[i] != static_cast<unsigned char>(seed * 31 + i * 7 + (i >> 8))) {
            return false;
        }
    }
    return true;
}

struct Leak {
    std::string pool;
    size_t nBlocks;
    size_t nBytes;
};
std::vector<Leak> vLeakG;
void NoteLeak(const char* pool, size_t nBlocks, size_t nBytes) {
    vLeakG.push_back({pool, nBlocks, nBytes});
}

class LeakReporting {
 public:
    LeakReporting() {
        vLeakG.clear();
        RoxMempool::SetLeakReporter(&NoteLeak);
    }
    ~LeakReporting() { RoxMempool::SetLeakReporter(nullptr); }
};

}  // namespace

TEST(MempoolTest, NewPoolHoldsNothing) {
    size_t before = RoxMempool::GetSystemBytes();
    std::string name = "films";
    RoxMempool pool(name.c_str());
    name = "other";
    EXPECT_STREQ("films", pool.GetName());
    EXPECT_EQ(0u, pool.GetUsedBytes());
    EXPECT_EQ(0u, pool.GetUnusedBytes());
    EXPECT_EQ(0u, pool.GetUsedBytesHighWater());
    EXPECT_EQ(0u, pool.GetHighWaterUsedBytes());
    EXPECT_EQ(before, RoxMempool::GetSystemBytes());
}

TEST(MempoolTest, UsedBytesAreThoseOfTheClass) {
    if (fPoisoning) {
        GTEST_SKIP() << "blocks are larger by their redzones";
    }
    for (const ClassCase& c : vClassCase) {
        RoxMempool pool("classes");
        void* p = pool.Malloc(c.requested);
        EXPECT_EQ(c.used, pool.GetUsedBytes()) << c.requested;
        EXPECT_EQ(c.used, pool.GetUsedBytesHighWater()) << c.requested;
        EXPECT_EQ(RoxMempool::GetSystemBytes(), pool.GetUsedBytes() + pool.GetUnusedBytes()) << c.requested;
        pool.Free(p);
        EXPECT_EQ(0u, pool.GetUsedBytes()) << c.requested;
        EXPECT_EQ(c.used, pool.GetHighWaterUsedBytes()) << c.requested;
    }
}

TEST(MempoolTest, SmallBlocksComeFromOneChunkOf64KiB) {
    RoxMempool pool("chunk");
    void* p = pool.Malloc(8);
    EXPECT_EQ(65536u, pool.GetUsedBytes() + pool.GetUnusedBytes());
    pool.Free(p);
    EXPECT_EQ(65536u, pool.GetUnusedBytes());
}

TEST(MempoolTest, HighWaterIsTheMostEverUsed) {
    RoxMempool pool("high water");
    void* a = pool.Malloc(104);
    void* b = pool.Malloc(104);
    size_t two = pool.GetUsedBytes();
    pool.Free(a);
    size_t one = pool.GetUsedBytes();
    EXPECT_EQ(two, 2 * one);
    void* c = pool.Malloc(104);
    EXPECT_EQ(two, pool.GetUsedBytesHighWater());
    void* d = pool.Malloc(104);
    EXPECT_EQ(3 * one, pool.GetUsedBytesHighWater());
    pool.Free(b);
    pool.Free(c);
    pool.Free(d);
    EXPECT_EQ(0u, pool.GetUsedBytes());
    EXPECT_EQ(3 * one, pool.GetUsedBytesHighWater());
    EXPECT_EQ(3 * one, pool.GetHighWaterUsedBytes());
}

TEST(MempoolTest, BlocksAreAligned) {
    RoxMempool pool("aligned");
    for (size_t n = 0; n <= 20000; n += n < 600 ? 1 : 97) {
        void* p = pool.Malloc(n);
        uintptr_t alignment = n != 0 && n % 16 == 0 ? 16 : 8;
        EXPECT_EQ(0u, reinterpret_cast<uintptr_t>(p) % (fPoisoning ? 8 : alignment)) << n;
    }
}

TEST(MempoolTest, CallocClearsWhatWasUsedBefore) {
    for (size_t n : {1u, 24u, 1000u, 16384u, 16385u, 300000u}) {
        RoxMempool pool("cleared");
        for (int round = 0; round < 3; ++round) {
            unsigned char* p = static_cast<unsigned char*>(pool.Calloc(n));
            for (size_t i = 0; i < n; ++i) {
                ASSERT_EQ(0, p[i]) << n << " round " << round;
            }
            memset(p, 0xEE, n);
            pool.Free(p);
        }
    }
}

TEST(MempoolTest, ReallocKeepsTheContents) {
    constexpr size_t vSize[] = {1,     8,       9,      100,   128,   129,     5000,   16384,
                                16385, 20000,   20001,  65536, 70000, 70001,   500000, 100000,
                                20000, 3000000, 400000, 16384, 100,   2000000, 7,      1};
    RoxMempool pool("resized");
    size_t old = 3;
    void* p = pool.Realloc(nullptr, old);
    Fill(p, old, 0);
    unsigned seed = 0;
    for (size_t n : vSize) {
        p = pool.Realloc(p, n);
        EXPECT_TRUE(FFilled(p, std::min(old, n), seed)) << old << " to " << n;
        Fill(p, n, ++seed);
        EXPECT_GE(pool.GetUsedBytes(), n);
        old = n;
    }
    pool.Free(p);
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(MempoolTest, ReallocCountsTheNewClassOnly) {
    if (fPoisoning) {
        GTEST_SKIP() << "blocks are larger by their redzones";
    }
    RoxMempool pool("resized");
    void* p = pool.Malloc(10);
    for (const ClassCase& c : vClassCase) {
        p = pool.Realloc(p, c.requested);
        EXPECT_EQ(c.used, pool.GetUsedBytes()) << c.requested;
    }
    for (const ClassCase& c : vClassCase) {
        p = pool.Realloc(p, c.requested);
        EXPECT_EQ(c.used, pool.GetUsedBytes()) << c.requested;
    }
}

TEST(MempoolTest, GrowingByAFifthMovesLittle) {
    RoxMempool pool("grows");
    size_t n = 256;
    void* p = pool.Malloc(n);
    unsigned nMoves = 0;
    while (n < 5 * 1024 * 1024) {
        n += n / 5;
        void* moved = pool.Realloc(p, n);
        nMoves += moved != p ? 1 : 0;
        p = moved;
    }
    // 55 steps; above 16 KiB the block has headroom for as much again, so that only each doubling may move
    // it.
    if (!fPoisoning) {
        EXPECT_LE(nMoves, 23u + 9u);
    }
    pool.Free(p);
}

TEST(MempoolTest, FreedMemoryIsUsedAgain) {
    for (size_t n : {8u, 100u, 1000u, 5000u, 16000u, 30000u, 1000000u}) {
        RoxMempool pool("again");
        std::vector<void*> blocks;
        size_t most = 0;
        for (int round = 0; round < 4; ++round) {
            for (size_t i = 0; i < 3000000 / n + 1; ++i) {
                blocks.push_back(pool.Malloc(n));
            }
            size_t held = pool.GetUsedBytes() + pool.GetUnusedBytes();
            EXPECT_TRUE(round == 0 || held == most) << n;
            most = held;
            for (void* p : blocks) {
                pool.Free(p);
            }
            blocks.clear();
            EXPECT_EQ(0u, pool.GetUsedBytes());
        }
    }
}

TEST(MempoolTest, PagesOfOneClassServeAnother) {
    RoxMempool pool("phases");
    size_t held = 0;
    for (size_t n : {40u, 56u, 72u, 104u, 200u, 1000u}) {
        std::vector<void*> blocks;
        for (size_t i = 0; i < 2000000 / n; ++i) {
            blocks.push_back(pool.Malloc(n));
        }
        held = std::max(held, pool.GetUsedBytes() + pool.GetUnusedBytes());
        for (void* p : blocks) {
            pool.Free(p);
        }
    }
    // Six phases of 2 MB, one after the other: far from the 12 MB of all together.
    EXPECT_LT(held, 5000000u);
}

TEST(MempoolTest, KeptMemoryIsBounded) {
    RoxMempool pool("bounded");
    std::vector<void*> blocks;
    for (int i = 0; i < 100; ++i) {
        blocks.push_back(pool.Malloc(1000000));
    }
    EXPECT_GE(pool.GetUsedBytes(), 100000000u);
    for (void* p : blocks) {
        pool.Free(p);
    }
    EXPECT_LE(pool.GetUnusedBytes(), size_t{33} * 1024 * 1024);
    std::vector<void*> small;
    for (int i = 0; i < 800000; ++i) {
        small.push_back(pool.Malloc(128));
    }
    EXPECT_GE(pool.GetUsedBytes(), 102400000u);
    for (void* p : small) {
        pool.Free(p);
    }
    EXPECT_LE(pool.GetUnusedBytes(), size_t{98} * 1024 * 1024);
    pool.Free(pool.Malloc(40 * 1024 * 1024));  // too large to be kept
    EXPECT_LE(pool.GetUnusedBytes(), size_t{98} * 1024 * 1024);
}

TEST(MempoolTest, DestructorGivesEverythingBack) {
    size_t before = RoxMempool::GetSystemBytes();
    {
        RoxMempool pool("given back");
        for (size_t n = 1; n < 3000000; n += n / 3 + 1) {
            void* p = pool.Malloc(n);
            if (n % 2 == 0) {
                pool.Free(p);
            }
        }
        EXPECT_EQ(before + pool.GetUsedBytes() + pool.GetUnusedBytes(), RoxMempool::GetSystemBytes());
        EXPECT_GT(pool.GetUsedBytes(), 3000000u);
    }
    EXPECT_EQ(before, RoxMempool::GetSystemBytes());
}

TEST(MempoolTest, RandomWorkKeepsBlocksApartAndFiguresTrue) {
    struct Block {
        void* p;
        size_t n;
        size_t counted;
        unsigned seed;
    };
    RoxMempool pool("random");
    Random random(12345);
    std::vector<Block> blocks;
    size_t used = 0;
    size_t high = 0;
    for (unsigned step = 0; step < 60000; ++step) {
        unsigned choice = random() % 10;
        if (choice < 5 || blocks.empty()) {
            size_t n = random() % 100 == 0 ? random() % 100000
                       : random() % 8 == 0 ? random() % 5000
                                           : random() % 200;
            Block block{pool.Malloc(n), n, 0, step};
            block.counted = pool.GetUsedBytes() - used;
            EXPECT_GE(block.counted, n);
            Fill(block.p, n, step);
            blocks.push_back(block);
        } else {
            std::swap(blocks[random() % blocks.size()], blocks.back());
            Block& block = blocks.back();
            ASSERT_TRUE(FFilled(block.p, block.n, block.seed)) << "step " << step;
            if (choice < 7) {
                size_t n = random() % 2 == 0 ? random() % 300 : random() % 40000;
                block.p = pool.Realloc(block.p, n);
                ASSERT_TRUE(FFilled(block.p, std::min(n, block.n), block.seed)) << "step " << step;
                Fill(block.p, n, block.seed);
                block.counted = pool.GetUsedBytes() - (used - block.counted);
                block.n = n;
            } else {
                pool.Free(block.p);
                ASSERT_EQ(used - block.counted, pool.GetUsedBytes());
                blocks.pop_back();
            }
        }
        used = 0;
        for (const Block& block : blocks) {
            used += step % 64 == 0 ? block.counted : 0;
        }
        ASSERT_TRUE(step % 64 != 0 || used == pool.GetUsedBytes()) << "step " << step;
        used = pool.GetUsedBytes();
        high = std::max(high, used);
    }
    EXPECT_GE(pool.GetUsedBytesHighWater(), high);
    for (const Block& block : blocks) {
        ASSERT_TRUE(FFilled(block.p, block.n, block.seed));
        pool.Free(block.p);
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(MempoolTest, NullPoolIsTheGeneralHeap) {
    unsigned char* p = static_cast<unsigned char*>(RoxMempool::CallocIn(nullptr, 100));
    for (int i = 0; i < 100; ++i) {
        ASSERT_EQ(0, p[i]);
    }
    Fill(p, 100, 1);
    p = static_cast<unsigned char*>(RoxMempool::ReallocIn(nullptr, p, 100000));
    EXPECT_TRUE(FFilled(p, 100, 1));
    RoxMempool::FreeIn(nullptr, p);
    RoxMempool::FreeIn(nullptr, RoxMempool::MallocIn(nullptr, 0));
    RoxMempool::FreeIn(nullptr, RoxMempool::CallocIn(nullptr, 0));
    RoxMempool::FreeIn(nullptr, nullptr);

    RoxMempool pool("told");
    void* q = RoxMempool::MallocIn(&pool, 10);
    q = RoxMempool::ReallocIn(&pool, q, 20);
    void* r = RoxMempool::CallocIn(&pool, 20);
    EXPECT_GE(pool.GetUsedBytes(), 40u);
    RoxMempool::FreeIn(&pool, q);
    RoxMempool::FreeIn(&pool, r);
    RoxMempool::FreeIn(&pool, nullptr);
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(MempoolTest, LeakReporterNamesPoolBlocksAndBytes) {
    LeakReporting reporting;
    size_t used = 0;
    {
        RoxMempool clean("clean");
        clean.Free(clean.Malloc(100));
        RoxMempool pool("leaky");
        pool.Free(pool.Malloc(10));
        for (size_t n : {10u, 10u, 3000u, 15000u, 100000u}) {
            void* p = pool.Malloc(n);
            EXPECT_NE(nullptr, p);
        }
        used = pool.GetUsedBytes();
    }
    ASSERT_EQ(1u, vLeakG.size());
    EXPECT_EQ("leaky", vLeakG[0].pool);
    EXPECT_EQ(5u, vLeakG[0].nBlocks);
    EXPECT_EQ(used, vLeakG[0].nBytes);
}

TEST(MempoolTest, WithoutReporterALeakIsSilent) {
    vLeakG.clear();
    {
        RoxMempool pool("leaky");
        EXPECT_NE(nullptr, pool.Malloc(10));
    }
    EXPECT_TRUE(vLeakG.empty());
}

TEST(MempoolDeathTest, ExhaustedMemoryAsserts) {
    RoxMempool pool("small device");
    // A 32-bit host has room for two such blocks at most, a 64-bit one for none.
    volatile size_t huge = sizeof(void*) == 4 ? 0x70000000 : SIZE_MAX / 2 - 1000000;
    auto words = [](size_t n) {
        return "assertion failed: out of memory: pool small device, " + std::to_string(n) + " bytes";
    };
    auto exhaust = [&] {
        for (int i = 0; i < 3; ++i) {
            static_cast<void>(pool.Malloc(huge));
        }
    };
    EXPECT_DEATH(exhaust(), words(huge));
    void* large = pool.Malloc(100000);
    auto grow = [&] {
        static_cast<void>(pool.Realloc(large, huge));
        static_cast<void>(pool.Realloc(pool.Malloc(10), huge));
        static_cast<void>(pool.Realloc(nullptr, huge));
    };
    EXPECT_DEATH(grow(), words(huge));
}

TEST(MempoolDeathTest, ImpossibleSizesAssert) {
    RoxMempool pool("small device");
    for (volatile size_t n :
         {SIZE_MAX, SIZE_MAX - 1, SIZE_MAX - 15, SIZE_MAX - 64, SIZE_MAX - 4096, SIZE_MAX / 2 + 1}) {
        std::string words =
            "assertion failed: out of memory: pool small device, " + std::to_string(n) + " bytes";
        EXPECT_DEATH(static_cast<void>(pool.Malloc(n)), words);
        EXPECT_DEATH(static_cast<void>(pool.Calloc(n)), words);
        void* small = pool.Malloc(10);
        void* large = pool.Malloc(100000);
        EXPECT_DEATH(static_cast<void>(pool.Realloc(small, n)), words);
        EXPECT_DEATH(static_cast<void>(pool.Realloc(large, n)), words);
    }
}

TEST(MempoolDeathTest, BlockOfAnotherPoolAsserts) {
    RoxMempool one("one");
    RoxMempool two("two");
    void* small = one.Malloc(10);
    void* large = one.Malloc(100000);
    static_cast<void>(two.Malloc(10));
    EXPECT_DEATH(two.Free(small), "pool two: a block that is freed belongs to another pool");
    EXPECT_DEATH(two.Free(large), "pool two: a block that is freed belongs to another pool");
    EXPECT_DEATH(static_cast<void>(two.Realloc(small, 20)),
                 "pool two: a block that is resized belongs to another pool");
}
