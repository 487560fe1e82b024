#pragma once

#include "rox/RoxGenericArray.h"
#include "rox/ref.h"

/// RoxGenericArray whose elements are all null or a T.
template <class T>
class RoxArray : public RoxGenericArray {
 public:
    using RoxGenericArray::RoxGenericArray;

    bool Add(T* p) { return RoxGenericArray::Add(p); }
    bool Add(const ref<T>& r) { return RoxGenericArray::Add(r.GetCore()); }
    bool Remove(T* p) { return RoxGenericArray::Remove(p); }
    void Set(unsigned i, T* p) { RoxGenericArray::Set(i, p); }

    T* At(unsigned i) const { return static_cast<T*>(RoxGenericArray::At(i)); }
    T* operator[](unsigned i) const { return At(i); }
};
