#pragma once

#include "rox/RoxCore.h"

/// How a hash table holds reference-counted values. Null needs no hold.
class RoxCoreOwner {
 public:
    static void Own(RoxCore* p) {
        if (p != nullptr) {
            p->UpRef();
        }
    }
    static void Disown(RoxCore* p) { RoxCore::DownRef(p); }
};
