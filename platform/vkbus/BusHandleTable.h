#pragma once

#include <cstdint>
#include <unordered_map>
#include <utility>
#include <vector>

#include "rox/RoxMutexHold.h"
#include "rox/ref.h"
#include "vkbus/BusLockLevel.h"

/// What the handles of one kind stand for. Whoever finds an object holds a reference, so that it outlives a
/// close on another thread. Any thread.
template <class T>
class BusHandleTable {
 public:
    void Add(uint32_t handle, T* object) {
        RoxMutexHold hold(mutexM);
        objectsM[handle] = object;
    }
    /// Null for an unknown handle.
    ref<T> Find(uint32_t handle) {
        RoxMutexHold hold(mutexM);
        const auto found = objectsM.find(handle);
        return found != objectsM.end() ? found->second : ref<T>();
    }
    /// The same, and forgets the handle.
    ref<T> Take(uint32_t handle) {
        ref<T> taken;
        RoxMutexHold hold(mutexM);
        const auto found = objectsM.find(handle);
        if (found != objectsM.end()) {
            taken = std::move(found->second);
            objectsM.erase(found);
        }
        return taken;
    }
    std::vector<uint32_t> All() {
        std::vector<uint32_t> handles;
        RoxMutexHold hold(mutexM);
        for (const auto& [handle, object] : objectsM) {
            handles.push_back(handle);
        }
        return handles;
    }

 private:
    RoxMutex mutexM{BusLockLevel::handlesG};
    std::unordered_map<uint32_t, ref<T>> objectsM;
};
