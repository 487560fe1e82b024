#include "rox/RoxInitInfo.h"

#include <gtest/gtest.h>

#include <list>
#include <string>
#include <thread>
#include <vector>

#include "DeathTestStyle.h"
#include "rox/RoxLogger.h"
#include "rox/RoxMempool.h"

namespace {

constexpr unsigned nModules = 6;
const char* const vNames[nModules] = {"A", "B", "C", "D", "E", "F"};

std::string traceG;
unsigned vResultG[nModules];
RoxMempool* pPoolG;

template <unsigned number>
unsigned Start(RoxMempool* pool) {
    pPoolG = pool;
    traceG += std::string(vResultG[number] == 0 ? "+" : "!") + vNames[number];
    return vResultG[number];
}

template <unsigned number>
void Stop() {
    traceG += std::string("-") + vNames[number];
}

const RoxInitInfo::Start vStart[nModules] = {Start<0>, Start<1>, Start<2>, Start<3>, Start<4>, Start<5>};
const RoxInitInfo::Stop vStop[nModules] = {Stop<0>, Stop<1>, Stop<2>, Stop<3>, Stop<4>, Stop<5>};

/// Up to six modules, each with a place from the beginning, so that tables of dependencies can name records
/// that are not made yet.
class Modules {
 public:
    /// Words such as "A<BC": A needs B and C. They are made in the order of the words.
    explicit Modules(const std::string& words) {
        for (size_t i = 0; i < words.size();) {
            const size_t end = std::min(words.find(' ', i), words.size());
            Make(words.substr(i, end - i));
            i = end + 1;
        }
    }
    Modules(const Modules&) = delete;
    Modules& operator=(const Modules&) = delete;
    ~Modules() {
        for (unsigned number = 0; number < nModules; ++number) {
            Destroy(vNames[number][0]);
        }
    }

    void Make(const std::string& word) {
        const unsigned number = static_cast<unsigned>(word[0] - 'A');
        for (size_t i = 2; i < word.size(); ++i) {
            vDependencies[number].push_back(Place(word[i]));
        }
        new (Place(word[0])) RoxInitInfo(vNames[number], vStart[number], vStop[number],
                                         static_cast<unsigned>(vDependencies[number].size()),
                                         vDependencies[number].data(), 0, nullptr);
        vMade[number] = true;
    }
    void Destroy(char name) {
        if (std::exchange(vMade[name - 'A'], false)) {
            Place(name)->~RoxInitInfo();
        }
    }
    RoxInitInfo* Place(char name) { return reinterpret_cast<RoxInitInfo*>(places[name - 'A']); }
    std::string Running() {
        std::string names;
        for (unsigned number = 0; number < nModules; ++number) {
            if (vMade[number] && Place(vNames[number][0])->FRunning()) names += vNames[number];
        }
        return names;
    }

 private:
    alignas(RoxInitInfo) unsigned char places[nModules][sizeof(RoxInitInfo)];
    std::vector<RoxInitInfo*> vDependencies[nModules];
    bool vMade[nModules] = {};
};

class InitInfoTest : public ::testing::Test {
 protected:
    void SetUp() override {
        UseDeathTestStyleForThreads();
        traceG.clear();
        for (unsigned& result : vResultG) result = 0;
    }
    void TearDown() override { RoxInitInfo::StopAll(); }

    std::string Trace() { return std::exchange(traceG, std::string()); }
};

TEST_F(InitInfoTest, StartsInTheOrderOfDependenciesAndStopsInReverse) {
    static const struct {
        const char* modules;
        const char* starts;
        const char* stops;
    } cases[] = {
        {"", "", ""},
        {"A", "+A", "-A"},
        {"C A B", "+A+B+C", "-C-B-A"},
        {"A<B B<C C", "+C+B+A", "-A-B-C"},
        {"C B<C A<B", "+C+B+A", "-A-B-C"},
        {"A<BC B<D C<D D", "+D+B+C+A", "-A-C-B-D"},
        {"A<CB D C<D B<D", "+D+B+C+A", "-A-C-B-D"},
        {"A<F B F", "+B+F+A", "-A-F-B"},
        {"A<BBB B", "+B+A", "-A-B"},
        // Two diamonds on top of each other: F, then D and E, then C; B needs the lower one only.
        {"A<BC B<DE C<DE D<F E<F F", "+F+D+E+B+C+A", "-A-C-B-E-D-F"},
        {"A<D B<A C D<C E<B", "+C+D+A+B+E", "-E-B-A-D-C"},
    };
    for (const auto& each : cases) {
        SCOPED_TRACE(each.modules);
        Modules modules(each.modules);
        EXPECT_EQ(0u, RoxInitInfo::StartAll(nullptr));
        EXPECT_EQ(each.starts, Trace());
        RoxInitInfo::StopAll();
        EXPECT_EQ(each.stops, Trace());
    }
}

TEST_F(InitInfoTest, TwiceIsHarmless) {
    Modules modules("A<B B");
    EXPECT_EQ("", modules.Running());
    for (int round = 0; round < 2; ++round) {
        EXPECT_EQ(0u, RoxInitInfo::StartAll(nullptr));
        EXPECT_EQ(0u, RoxInitInfo::StartAll(nullptr));
        EXPECT_EQ("+B+A", Trace());
        EXPECT_EQ("AB", modules.Running());
        RoxInitInfo::StopAll();
        RoxInitInfo::StopAll();
        EXPECT_EQ("-A-B", Trace());
        EXPECT_EQ("", modules.Running());
    }
}

TEST_F(InitInfoTest, ThePoolIsHandedOn) {
    RoxMempool pool("modules");
    Modules modules("A");
    EXPECT_EQ(0u, RoxInitInfo::StartAll(&pool));
    EXPECT_EQ(&pool, pPoolG);
}

TEST_F(InitInfoTest, AStartThatFailsStopsWhatWasStarted) {
    static const struct {
        const char* modules;
        char failing;
        const char* trace;
    } cases[] = {
        {"A", 'A', "!A"},
        {"A B C D", 'C', "+A+B!C-B-A"},
        {"A<C B C<D D", 'A', "+B+D+C!A-C-D-B"},
        {"A<BC B<D C<D D", 'D', "!D"},
    };
    std::string log;
    RoxLogger::SetSink(
        [](void* context, int, int, const char* tag, const char* message) {
            *static_cast<std::string*>(context) += std::string(tag) + ": " + message;
        },
        &log);
    for (const auto& each : cases) {
        SCOPED_TRACE(each.modules);
        Modules modules(each.modules);
        vResultG[each.failing - 'A'] = 7;
        EXPECT_EQ(7u, RoxInitInfo::StartAll(nullptr));
        EXPECT_EQ(each.trace, Trace());
        EXPECT_EQ("", modules.Running());
        EXPECT_EQ(std::string("RoxInitInfo: ") + each.failing + " did not start: 7", std::exchange(log, ""));
        vResultG[each.failing - 'A'] = 0;
        EXPECT_EQ(0u, RoxInitInfo::StartAll(nullptr));
        RoxInitInfo::StopAll();
        Trace();
    }
    RoxLogger::SetSink(nullptr, nullptr);
}

TEST_F(InitInfoTest, ModulesThatCameLaterStartWithTheNextCall) {
    Modules modules("B D<B");
    EXPECT_EQ(0u, RoxInitInfo::StartAll(nullptr));
    modules.Make("A<D");
    modules.Make("C");
    EXPECT_EQ("+B+D", Trace());
    vResultG[2] = 1;
    EXPECT_EQ(1u, RoxInitInfo::StartAll(nullptr));
    EXPECT_EQ("+A!C-A", Trace());
    EXPECT_EQ("BD", modules.Running());
    vResultG[2] = 0;
    EXPECT_EQ(0u, RoxInitInfo::StartAll(nullptr));
    EXPECT_EQ("+A+C", Trace());
    RoxInitInfo::StopAll();
    EXPECT_EQ("-C-A-D-B", Trace());
}

TEST_F(InitInfoTest, ALibraryThatUnloadsTakesItsRecordsOut) {
    Modules modules("A B C");
    EXPECT_EQ(0u, RoxInitInfo::StartAll(nullptr));
    Trace();
    modules.Destroy('B');
    RoxInitInfo::StopAll();
    EXPECT_EQ("-C-A", Trace());
    modules.Destroy('A');
    EXPECT_EQ(0u, RoxInitInfo::StartAll(nullptr));
    EXPECT_EQ("+C", Trace());
    modules.Destroy('C');
    RoxInitInfo::StopAll();
    EXPECT_EQ("", Trace());
}

Modules* pModulesG;

TEST_F(InitInfoTest, AStartMayLoadALibrary) {
    Modules modules("C");
    pModulesG = &modules;
    RoxInitInfo loader(
        "B",
        [](RoxMempool*) {
            traceG += "+loader";
            pModulesG->Make("A<C");
            return 0u;
        },
        nullptr, 0, nullptr, 0, nullptr);
    EXPECT_EQ(0u, RoxInitInfo::StartAll(nullptr));
    EXPECT_EQ("+loader+C+A", Trace());
    RoxInitInfo::StopAll();
    EXPECT_EQ("-A-C", Trace());
}

TEST_F(InitInfoTest, StartAndStopMayBeNull) {
    RoxInitInfo empty("empty", nullptr, nullptr, 0, nullptr, 0, nullptr);
    EXPECT_STREQ("empty", empty.GetName());
    EXPECT_EQ(0u, RoxInitInfo::StartAll(nullptr));
    EXPECT_TRUE(empty.FRunning());
    RoxInitInfo::StopAll();
    EXPECT_FALSE(empty.FRunning());
}

TEST_F(InitInfoTest, LibrariesMayBeLoadedByManyThreads) {
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; ++i) {
        threads.emplace_back([] {
            for (int round = 0; round < 200; ++round) {
                RoxInitInfo first("x", nullptr, nullptr, 0, nullptr, 0, nullptr);
                RoxInitInfo* const vDependencies[] = {&first};
                RoxInitInfo second("w", nullptr, nullptr, 1, vDependencies, 0, nullptr);
            }
        });
    }
    for (std::thread& thread : threads) thread.join();
    Modules modules("A");
    EXPECT_EQ(0u, RoxInitInfo::StartAll(nullptr));
    EXPECT_EQ("+A", Trace());
}

using InitInfoDeathTest = InitInfoTest;

TEST_F(InitInfoDeathTest, RingsEndTheProcessWithTheirNames) {
    static const struct {
        const char* modules;
        const char* words;
    } cases[] = {
        {"A<A", "in a ring: A needs A\n"},
        {"A<B B<A", "in a ring: (A needs B needs A|B needs A needs B)\n"},
        {"A<B B<C C<B D", "in a ring: (B needs C needs B|C needs B needs C)\n"},
        {"A<BC B C<D D<E E<C",
         "(C needs D needs E needs C|D needs E needs C needs D|E needs C needs D needs E)\n"},
    };
    for (const auto& each : cases) {
        SCOPED_TRACE(each.modules);
        EXPECT_DEATH(
            {
                Modules modules(each.modules);
                RoxInitInfo::StartAll(nullptr);
            },
            each.words);
    }
}

TEST_F(InitInfoDeathTest, ADependencyThatIsNotLoaded) {
    EXPECT_DEATH(
        {
            Modules modules("A<B");
            RoxInitInfo::StartAll(nullptr);
        },
        "A depends on a module that is not loaded");
}

}  // namespace
