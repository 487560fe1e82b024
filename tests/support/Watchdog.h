#pragma once

#include <unistd.h>

#include <csignal>
#include <cstdlib>

/// Ends the process when a test hangs: unless it is destroyed within the time, which no test comes near, even
/// under an emulator. It has no thread, so that death tests can have it around them.
class Watchdog {
 public:
    static constexpr unsigned secondsG = 120;

    Watchdog() {
        struct sigaction action {};
        action.sa_handler = OnAlarm;
        sigaction(SIGALRM, &action, &beforeM);
        alarm(secondsG);
    }
    Watchdog(const Watchdog&) = delete;
    Watchdog& operator=(const Watchdog&) = delete;
    ~Watchdog() {
        alarm(0);
        sigaction(SIGALRM, &beforeM, nullptr);
    }

 private:
    static void OnAlarm(int) {
        constexpr char words[] = "the test hangs\n";
        [[maybe_unused]] const ssize_t nWritten = write(STDERR_FILENO, words, sizeof words - 1);
        abort();
    }

    struct sigaction beforeM {};
};
