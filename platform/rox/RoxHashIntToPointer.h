#pragma once

#include "rox/RoxHashIntTable.h"

/// How a hash table holds pointers that are not its own: not at all.
struct RoxPointerNoOwner {
    static void Own(void*) {}
    static void Disown(void*) {}
};

/// Table from 32-bit numbers to pointers. Not thread-safe.
template <class T>
using RoxHashIntToPointer = RoxHashIntTable<T, RoxPointerNoOwner>;
