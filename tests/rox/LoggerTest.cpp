#include "rox/RoxLogger.h"

#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <vector>

namespace {

struct Line {
    int facility;
    int priority;
    std::string tag;
    std::string message;
};

void Collect(void* context, int facility, int priority, const char* tag, const char* message) {
    static_cast<std::vector<Line>*>(context)->push_back({facility, priority, tag, message});
}

void CollectAndStop(void* context, int facility, int priority, const char* tag, const char* message) {
    RoxLogger::SetSink(nullptr, nullptr);
    Collect(context, facility, priority, tag, message);
}

class LoggerTest : public testing::Test {
 protected:
    void TearDown() override { RoxLogger::SetSink(nullptr, nullptr); }
    std::vector<Line> linesM;
};

}  // namespace

TEST_F(LoggerTest, SinkGetsTheFormattedLine) {
    RoxLogger::SetSink(&Collect, &linesM);
    RoxLogger::Log(0, 6, "LazyDict", "%s took %d", "it", 5);
    RoxLogger::Log(3, 1, nullptr, "plain");
    ASSERT_EQ(2u, linesM.size());
    EXPECT_EQ(0, linesM[0].facility);
    EXPECT_EQ(6, linesM[0].priority);
    EXPECT_EQ("LazyDict", linesM[0].tag);
    EXPECT_EQ("it took 5", linesM[0].message);
    EXPECT_EQ("", linesM[1].tag);
}

TEST_F(LoggerTest, LinesOfAnyLength) {
    RoxLogger::SetSink(&Collect, &linesM);
    for (size_t n : {0u, 1u, 510u, 511u, 512u, 513u, 100000u}) {
        std::string text(n, 'm');
        RoxLogger::Log(0, 0, "t", "%s", text.c_str());
        EXPECT_EQ(text, linesM.back().message);
    }
}

TEST_F(LoggerTest, DefaultSinkWritesToStandardError) {
    testing::internal::CaptureStderr();
    RoxLogger::Log(0, 6, "LazyDict", "seen %d", 1);
    EXPECT_EQ("[0.6] LazyDict: seen 1\n", testing::internal::GetCapturedStderr());
}

TEST_F(LoggerTest, SinkMayChangeTheSink) {
    RoxLogger::SetSink(&CollectAndStop, &linesM);
    testing::internal::CaptureStderr();
    RoxLogger::Log(0, 6, "t", "first");
    RoxLogger::Log(0, 6, "t", "second");
    EXPECT_EQ("[0.6] t: second\n", testing::internal::GetCapturedStderr());
    ASSERT_EQ(1u, linesM.size());
    EXPECT_EQ("first", linesM[0].message);
}

TEST_F(LoggerTest, LinesOfManyThreadsAreAllThere) {
    RoxLogger::SetSink(&Collect, &linesM);
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([i] {
            for (int k = 0; k < 500; ++k) {
                RoxLogger::Log(i, k, "t", "%d.%d", i, k);
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    RoxLogger::SetSink(nullptr, nullptr);
    EXPECT_EQ(2000u, linesM.size());
    for (const Line& line : linesM) {
        EXPECT_EQ(std::to_string(line.facility) + "." + std::to_string(line.priority), line.message);
    }
}
