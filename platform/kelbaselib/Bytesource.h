#pragma once

namespace kelbaselib {

/// Gives bytes. A source belongs to one thread at a time; it is released, never deleted.
class Bytesource {
 public:
    // The order of these operations in the table of virtual operations is fixed.

    /// Fills `buffer` with up to `capacity` bytes and gives how many; 0 for a capacity above 0 means that the
    /// source has ended.
    virtual unsigned Read(void* buffer, unsigned capacity) = 0;
    /// A new, independent source over the same data, from its start; the caller releases it. It outlives this
    /// one.
    virtual Bytesource* NewSource() = 0;
    /// Bytes that Read can still give as far as is known, 0 when it is not.
    virtual unsigned GetAvailable() const = 0;
    /// Ends the source; the pointer is dead then.
    virtual void Release() = 0;

    Bytesource(const Bytesource&) = delete;
    Bytesource& operator=(const Bytesource&) = delete;

 protected:
    Bytesource() = default;
    virtual ~Bytesource();
};

}  // namespace kelbaselib
