#pragma once

#include <random>

/// The same sequence of numbers for the same seed on every host.
class Random {
 public:
    explicit Random(unsigned seed) : engineM(seed) {}
    unsigned operator()() { return static_cast<unsigned>(engineM()); }

 private:
    std::mt19937 engineM;
};
