#pragma once

#include "rox/RoxStringRepN.h"

/// How a hash table holds string keys. Null is the empty text and needs no hold.
class RoxStringRepNOwner {
 public:
    static void Own(RoxStringRepN* rep) {
        if (rep != nullptr) {
            rep->UpRef();
        }
    }
    static void Disown(RoxStringRepN* rep) {
        if (rep != nullptr) {
            rep->DownRef();
        }
    }
};
