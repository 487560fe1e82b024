#pragma once

#include <unistd.h>

#include <utility>

/// Owns a file descriptor; -1 for none. One thread at a time.
class BusFd {
 public:
    BusFd() = default;
    explicit BusFd(int fd) : fdM(fd) {}
    BusFd(BusFd&& other) noexcept : fdM(other.Release()) {}
    BusFd& operator=(BusFd&& other) noexcept {
        Close();
        fdM = other.Release();
        return *this;
    }
    ~BusFd() { Close(); }

    int Get() const { return fdM; }
    bool FOpen() const { return fdM >= 0; }
    /// Gives it up; the caller closes it.
    int Release() { return std::exchange(fdM, -1); }
    void Close() {
        if (fdM >= 0) {
            close(std::exchange(fdM, -1));
        }
    }

 private:
    int fdM = -1;
};
