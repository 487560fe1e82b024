#include "rox/RoxCore.h"

#include <gtest/gtest.h>

#include <atomic>
#include <stdexcept>
#include <thread>
#include <vector>

#include "rox/VkCast.h"
#include "rox/ref.h"
#include "support/SmallStack.h"

namespace {

unsigned nDestroyedG = 0;

class Counted : public RoxCore {
 public:
    static const char classTagG;
    ~Counted() override { ++nDestroyedG; }
    void* VkCastHelper(const void* tag) override {
        return tag == &classTagG ? this : RoxCore::VkCastHelper(tag);
    }
    int number = 7;
};
const char Counted::classTagG = 0;

class Larger : public Counted {
 public:
    static const char classTagG;
    void* VkCastHelper(const void* tag) override {
        return tag == &classTagG ? this : Counted::VkCastHelper(tag);
    }
    unsigned char more[500] = {};
};
const char Larger::classTagG = 0;

class Stranger : public RoxCore {
 public:
    static const char classTagG;
};
const char Stranger::classTagG = 0;

class Node : public RoxCore {
 public:
    ~Node() override { ++nDestroyedG; }
    ref<Node> left;
    ref<Node> right;
};

/// A chain of n nodes, each holding the next, spread over the pools.
ref<Node> MakeChain(unsigned n, const std::vector<RoxMempool*>& pools) {
    ref<Node> first;
    for (unsigned i = 0; i < n; ++i) {
        ref<Node> node = new (pools[i % pools.size()]) Node;
        node->left = std::move(first);
        first = std::move(node);
    }
    return first;
}

class CoreTest : public testing::Test {
 protected:
    void SetUp() override { nDestroyedG = 0; }
};

}  // namespace

TEST_F(CoreTest, HeaderIsThreeWordsOnTheTarget) {
    if (sizeof(void*) == 4) {
        EXPECT_EQ(12u, sizeof(RoxCore));
    }
    // What derived classes add follows the count at once.
    class WithWord : public RoxCore {
     public:
        explicit WithWord() : RoxCore(nullptr) {}
        uint32_t word = 0;
    };
    WithWord object;
    EXPECT_EQ(2 * sizeof(void*) + 4,
              static_cast<size_t>(reinterpret_cast<char*>(&object.word) - reinterpret_cast<char*>(&object)));
}

TEST_F(CoreTest, ObjectKnowsItsPool) {
    RoxMempool pool("objects");
    ref<Counted> inPool = new (&pool) Counted;
    ref<Counted> inNull = new (nullptr) Counted;
    ref<Counted> onHeap = new Counted;
    EXPECT_EQ(&pool, inPool->GetMempool());
    EXPECT_EQ(nullptr, inNull->GetMempool());
    EXPECT_EQ(nullptr, onHeap->GetMempool());
    EXPECT_GE(pool.GetUsedBytes(), sizeof(Counted));
    inPool = nullptr;
    EXPECT_EQ(0u, pool.GetUsedBytes());
    EXPECT_EQ(1u, nDestroyedG);
}

TEST_F(CoreTest, PoolIsTheObjectsOwnWhenNewIsNested) {
    RoxMempool outer("outer");
    RoxMempool inner("inner");
    class Holder : public RoxCore {
     public:
        explicit Holder(RoxCore* part) : partM(part) {}
        ref<RoxCore> partM;
    };
    ref<Holder> holder = new (&outer) Holder(new (&inner) Larger);
    EXPECT_EQ(&outer, holder->GetMempool());
    EXPECT_EQ(&inner, holder->partM->GetMempool());
    holder = nullptr;
    EXPECT_EQ(0u, outer.GetUsedBytes());
    EXPECT_EQ(0u, inner.GetUsedBytes());
}

TEST_F(CoreTest, CountBeginsAtZero) {
    RoxMempool pool("objects");
    Counted* p = new (&pool) Counted;
    EXPECT_EQ(0u, p->GetRefCount());
    p->UpRef();
    p->UpRef();
    EXPECT_EQ(2u, p->GetRefCount());
    RoxCore::DownRef(p);
    EXPECT_EQ(1u, p->GetRefCount());
    EXPECT_EQ(0u, nDestroyedG);
    RoxCore::DownRef(p);
    EXPECT_EQ(1u, nDestroyedG);
    RoxCore::DownRef(nullptr);
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST_F(CoreTest, DeleteDestroysAndFreesThroughAnyBase) {
    RoxMempool pool("deleted");
    delete new (&pool) Counted;
    Counted* larger = new (&pool) Larger;
    delete larger;
    RoxCore* core = new (&pool) Larger;
    delete core;
    delete new Larger;
    EXPECT_EQ(4u, nDestroyedG);
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST_F(CoreTest, ObjectOnTheStackIsToldItsPool) {
    RoxMempool pool("stack");
    class OnStack : public RoxCore {
     public:
        explicit OnStack(RoxMempool* p) : RoxCore(p) {}
    };
    OnStack object(&pool);
    EXPECT_EQ(&pool, object.GetMempool());
    EXPECT_EQ(0u, object.GetRefCount());
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST_F(CoreTest, MemoryOfAnUnfinishedConstructorIsFreed) {
    class Throwing : public RoxCore {
     public:
        Throwing() { throw std::runtime_error("no"); }
    };
    RoxMempool pool("unfinished");
    EXPECT_THROW(new (&pool) Throwing, std::runtime_error);
    EXPECT_EQ(0u, pool.GetUsedBytes());
    EXPECT_THROW(new Throwing,
                 std::runtime_error);  // the leak check of AddressSanitizer looks after this one
}

TEST_F(CoreTest, CastFindsTheClassAndItsBases) {
    RoxMempool pool("cast");
    ref<RoxCore> counted = new (&pool) Counted;
    ref<RoxCore> larger = new (&pool) Larger;
    EXPECT_EQ(counted.get(), VkCast<Counted>(counted.get()));
    EXPECT_EQ(nullptr, VkCast<Larger>(counted));
    EXPECT_EQ(larger.get(), VkCast<Larger>(larger));
    EXPECT_EQ(larger.get(), VkCast<Counted>(larger));
    EXPECT_EQ(larger.get(), VkCast<RoxCore>(larger));
    EXPECT_EQ(nullptr, VkCast<Stranger>(larger));
    EXPECT_EQ(nullptr, VkCast<Larger>(nullptr));
    EXPECT_EQ(nullptr, VkCast<Larger>(ref<RoxCore>()));
}

TEST_F(CoreTest, DestructorMayTakeAndDropItsOwnObject) {
    class Curious : public RoxCore {
     public:
        ~Curious() override {
            ref<RoxCore> self = this;
            ++nDestroyedG;
        }
    };
    RoxMempool pool("curious");
    { ref<Curious> object = new (&pool) Curious; }
    EXPECT_EQ(1u, nDestroyedG);
    {
        // With a second holder on the way, the count itself falls to 0.
        ref<Curious> object = new (&pool) Curious;
        ref<Curious> second = object;
        object = nullptr;
    }
    EXPECT_EQ(2u, nDestroyedG);
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST_F(CoreTest, ChainOfAMillionDiesOnASmallStack) {
    RoxMempool pool("deep");
    ref<Node> chain = MakeChain(1000000, {&pool});
    RunOnSmallStack([&] { chain = nullptr; });
    EXPECT_EQ(1000000u, nDestroyedG);
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST_F(CoreTest, DeferredObjectsGoBackToTheirOwnPools) {
    RoxMempool one("one");
    RoxMempool two("two");
    ref<Node> chain = MakeChain(100000, {&one, &two, nullptr});
    EXPECT_GT(two.GetUsedBytes(), 0u);
    RunOnSmallStack([&] { chain = nullptr; });
    EXPECT_EQ(100000u, nDestroyedG);
    EXPECT_EQ(0u, one.GetUsedBytes());
    EXPECT_EQ(0u, two.GetUsedBytes());
}

TEST_F(CoreTest, AllIsDestroyedWhenTheOutermostReleaseReturns) {
    // A binary tree hung on a chain: many objects wait at once.
    RoxMempool pool("tree");
    std::vector<ref<Node>> level;
    for (unsigned i = 0; i < 4096; ++i) {
        level.push_back(MakeChain(20, {&pool}));
    }
    while (level.size() > 1) {
        std::vector<ref<Node>> next;
        for (size_t i = 0; i < level.size(); i += 2) {
            ref<Node> parent = new (&pool) Node;
            parent->left = level[i];
            parent->right = level[i + 1];
            next.push_back(parent);
        }
        level = std::move(next);
    }
    ref<Node> root = MakeChain(30, {&pool});
    root->right = level[0];
    level.clear();
    root = nullptr;
    EXPECT_EQ(4096u * 20 + 4095 + 30, nDestroyedG);
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

namespace {

/// Has a pool of its own, which its child may lie in.
class PoolHolder : public RoxCore {
 public:
    ~PoolHolder() override { ++nDestroyedG; }
    RoxMempool pool{"held"};
    ref<RoxCore> child;
};

/// A chain link in front of any object.
class Link : public RoxCore {
 public:
    explicit Link(ref<RoxCore> held) : next(std::move(held)) {}
    ~Link() override { ++nDestroyedG; }
    ref<RoxCore> next;
};

ref<RoxCore> Behind(unsigned nLinks, ref<RoxCore> last) {
    for (unsigned i = 0; i < nLinks; ++i) {
        last = ref<RoxCore>(new Link(std::move(last)));
    }
    return last;
}

unsigned nLeaksG = 0;
void CountLeak(const char*, size_t, size_t) {
    ++nLeaksG;
}

/// Counts the pools that end with live blocks.
class LeakCount {
 public:
    LeakCount() {
        nLeaksG = 0;
        RoxMempool::SetLeakReporter(&CountLeak);
    }
    ~LeakCount() { RoxMempool::SetLeakReporter(nullptr); }
};

/// Its destructor makes a pool with objects in it.
class Maker : public RoxCore {
 public:
    explicit Maker(unsigned n) : nLinks(n) {}
    ~Maker() override {
        RoxMempool pool("local");
        ref<Node> chain = MakeChain(nLinks, {&pool});
        ++nDestroyedG;
    }
    unsigned nLinks;
};

}  // namespace

TEST_F(CoreTest, PoolThatDiesInAChainOutlivesItsObjects) {
    LeakCount leaks;
    for (unsigned nBefore : {0u, 3u, 13u, 14u, 15u, 16u, 17u, 40u}) {
        for (unsigned nWithin : {1u, 3u, 15u, 40u}) {
            nDestroyedG = 0;
            ref<PoolHolder> holder = new PoolHolder;
            holder->child = MakeChain(nWithin, {&holder->pool});
            ref<RoxCore> chain = Behind(nBefore, std::move(holder));
            chain = nullptr;
            EXPECT_EQ(nBefore + 1 + nWithin, nDestroyedG) << nBefore << " " << nWithin;
        }
    }
    EXPECT_EQ(0u, nLeaksG);
}

TEST_F(CoreTest, PoolThatDiesInAChainWaitsForObjectsThatHoldItsOwn) {
    // The first child, which lies elsewhere, waits while the holder dies, and holds the last use of its pool.
    LeakCount leaks;
    for (unsigned nBefore : {0u, 3u, 14u, 15u, 16u, 40u}) {
        nDestroyedG = 0;
        ref<PoolHolder> holder = new PoolHolder;
        holder->child = new Link(MakeChain(2, {&holder->pool}));
        ref<RoxCore> chain = Behind(nBefore, std::move(holder));
        chain = nullptr;
        EXPECT_EQ(nBefore + 4, nDestroyedG) << nBefore;
    }
    EXPECT_EQ(0u, nLeaksG);
}

TEST_F(CoreTest, PoolsWithinPoolsDieInOrder) {
    LeakCount leaks;
    ref<PoolHolder> outermost = new PoolHolder;
    PoolHolder* innermost = outermost.get();
    for (unsigned i = 0; i < 40; ++i) {
        PoolHolder* inner = new (&innermost->pool) PoolHolder;
        innermost->child = inner;
        innermost = inner;
    }
    outermost = nullptr;
    EXPECT_EQ(41u, nDestroyedG);
    EXPECT_EQ(0u, nLeaksG);
}

TEST_F(CoreTest, DestructorMayMakeAPoolOfItsOwn) {
    LeakCount leaks;
    for (unsigned nBefore : {0u, 3u, 14u, 15u, 16u, 40u}) {
        for (unsigned nLinks : {1u, 15u, 40u}) {
            nDestroyedG = 0;
            ref<RoxCore> chain = Behind(nBefore, new Maker(nLinks));
            chain = nullptr;
            EXPECT_EQ(nBefore + 1 + nLinks, nDestroyedG) << nBefore << " " << nLinks;
        }
    }
    EXPECT_EQ(0u, nLeaksG);
}

TEST_F(CoreTest, ManyWaitingObjectsWithPoolsDieOnASmallStack) {
    class Crowd : public RoxCore {
     public:
        std::vector<ref<RoxCore>> vMember;
    };
    constexpr unsigned n = 20000;
    LeakCount leaks;
    ref<Crowd> crowd = new Crowd;
    for (unsigned i = 0; i < n; ++i) {
        crowd->vMember.push_back(new Maker(2));
    }
    ref<RoxCore> chain = Behind(15, std::move(crowd));
    RunOnSmallStack([&] { chain = nullptr; });
    EXPECT_EQ(15 + n * 3, nDestroyedG);
    EXPECT_EQ(0u, nLeaksG);
}

TEST_F(CoreTest, DeletedHeadOfAChainReleasesAll) {
    RoxMempool pool("deleted");
    Node* head = new (&pool) Node;
    head->left = MakeChain(50000, {&pool});
    RunOnSmallStack([&] { delete head; });
    EXPECT_EQ(50001u, nDestroyedG);
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST_F(CoreTest, ThreadsMayTakeTheFirstReferencesTogether) {
    constexpr unsigned nThreads = 4;
    RoxMempool pool("threads");
    for (unsigned round = 0; round < 300; ++round) {
        Counted* object = new (&pool) Counted;
        std::atomic<unsigned> nReady{0};
        std::vector<std::thread> threads;
        for (unsigned i = 0; i < nThreads; ++i) {
            threads.emplace_back([&] {
                ++nReady;
                while (nReady.load() != nThreads) {
                }
                object->UpRef();
            });
        }
        for (std::thread& thread : threads) {
            thread.join();
        }
        ASSERT_EQ(nThreads, object->GetRefCount()) << round;
        for (unsigned i = 0; i < nThreads; ++i) {
            RoxCore::DownRef(object);
        }
    }
    EXPECT_EQ(300u, nDestroyedG);
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST_F(CoreTest, CountIsAtomic) {
    RoxMempool pool("threads");
    for (int round = 0; round < 20; ++round) {
        nDestroyedG = 0;
        ref<Counted> shared = new (&pool) Counted;
        std::vector<std::thread> threads;
        for (int i = 0; i < 4; ++i) {
            threads.emplace_back([mine = shared]() mutable {
                for (int k = 0; k < 2000; ++k) {
                    ref<Counted> copy = mine;
                    ref<Counted> another = copy;
                    copy = nullptr;
                }
                mine = nullptr;
            });
        }
        shared = nullptr;  // whoever is last destroys it
        for (std::thread& thread : threads) {
            thread.join();
        }
        EXPECT_EQ(1u, nDestroyedG);
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
}
