#pragma once

#include <cstddef>

#if defined(__SANITIZE_ADDRESS__)
#define ROX_ADDRESS_SANITIZER 1
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define ROX_ADDRESS_SANITIZER 1
#endif
#endif

#if defined(ROX_ADDRESS_SANITIZER)
#include <sanitizer/asan_interface.h>
#include <sanitizer/lsan_interface.h>
#endif

/// What a pool tells AddressSanitizer; nothing in other builds.
namespace roxmempool {

#if defined(ROX_ADDRESS_SANITIZER)

constexpr bool fPoisoning = true;
constexpr size_t redzoneBytes = 16;

inline void Poison(const void* p, size_t n) {
    __asan_poison_memory_region(p, n);
}
inline void Unpoison(const void* p, size_t n) {
    __asan_unpoison_memory_region(p, n);
}
inline bool FPoisoned(const void* p) {
    return __asan_address_is_poisoned(p) != 0;
}
/// Bytes from p on, at most n, that may be touched.
inline size_t AccessibleBytes(void* p, size_t n) {
    void* bad = __asan_region_is_poisoned(p, n);
    return bad == nullptr ? n : static_cast<size_t>(static_cast<char*>(bad) - static_cast<char*>(p));
}
/// Mapped memory may hold the only pointers to blocks of the general heap, so the leak check must look into
/// it.
inline void NoteMapped(void* p, size_t n) {
    __lsan_register_root_region(p, n);
}
inline void NoteUnmapping(void* p, size_t n) {
    Unpoison(p, n);
    __lsan_unregister_root_region(p, n);
}

/// The link of a free block, which lies in poisoned memory.
__attribute__((no_sanitize_address, noinline)) inline void* GetLink(void* block) {
    return *static_cast<void**>(block);
}
__attribute__((no_sanitize_address, noinline)) inline void SetLink(void* block, void* next) {
    *static_cast<void**>(block) = next;
}

#else

constexpr bool fPoisoning = false;
constexpr size_t redzoneBytes = 0;

inline void Poison(const void*, size_t) {}
inline void Unpoison(const void*, size_t) {}
inline bool FPoisoned(const void*) {
    return false;
}
inline size_t AccessibleBytes(void*, size_t n) {
    return n;
}
inline void NoteMapped(void*, size_t) {}
inline void NoteUnmapping(void*, size_t) {}
inline void* GetLink(void* block) {
    return *static_cast<void**>(block);
}
inline void SetLink(void* block, void* next) {
    *static_cast<void**>(block) = next;
}

#endif

}  // namespace roxmempool
