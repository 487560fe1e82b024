#pragma once

#include <cstdint>

/// An opaque place in a RoxString; a new one stands at the start. A place past the end counts as the end.
class RoxStringPos {
 public:
    RoxStringPos() = default;
    friend bool operator==(const RoxStringPos&, const RoxStringPos&) = default;

 private:
    friend class RoxString;
    explicit RoxStringPos(uint32_t offset) : offsetM(offset) {}
    uint32_t offsetM = 0;  // in bytes
};
