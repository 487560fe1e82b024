#pragma once

#include <gtest/gtest.h>

/// For tests of a process's end that have threads around them: a child that begins anew. On the 32-bit
/// target, whose emulator's programs cannot execute themselves, a child that goes on from here.
inline void UseDeathTestStyleForThreads() {
    testing::FLAGS_gtest_death_test_style = sizeof(void*) == 4 ? "fast" : "threadsafe";
}
