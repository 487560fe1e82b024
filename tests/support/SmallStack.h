#pragma once

#include <gtest/gtest.h>
#include <pthread.h>

#include <functional>

/// Runs `work` on a thread with a stack of 256 KiB and waits for its end.
inline void RunOnSmallStack(std::function<void()> work) {
    pthread_attr_t attributes;
    ASSERT_EQ(0, pthread_attr_init(&attributes));
    ASSERT_EQ(0, pthread_attr_setstacksize(&attributes, 256 * 1024));
    pthread_t thread;
    auto run = [](void* p) -> void* {
        (*static_cast<std::function<void()>*>(p))();
        return nullptr;
    };
    ASSERT_EQ(0, pthread_create(&thread, &attributes, run, &work));
    ASSERT_EQ(0, pthread_join(thread, nullptr));
    ASSERT_EQ(0, pthread_attr_destroy(&attributes));
}
