#include "pairs/HeapMeter.h"

#include <malloc.h>

#include <atomic>

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
#define SORN_HEAP_IS_TAKEN 1
#elif defined(__has_feature)
#if __has_feature(address_sanitizer) || __has_feature(thread_sanitizer)
#define SORN_HEAP_IS_TAKEN 1
#endif
#endif

namespace sorntest {

namespace {
std::atomic<size_t> usedG{0};
std::atomic<size_t> peakG{0};

[[maybe_unused]] void* Count(void* p) {
    size_t used = usedG += malloc_usable_size(p);
    size_t peak = peakG;
    while (used > peak && !peakG.compare_exchange_weak(peak, used)) {
    }
    return p;
}
[[maybe_unused]] void Discount(void* p) {
    usedG -= malloc_usable_size(p);
}
}  // namespace

bool HeapMeter::FCounts() {
#ifdef SORN_HEAP_IS_TAKEN
    return false;
#else
    return true;
#endif
}
size_t HeapMeter::Used() {
    return usedG;
}
size_t HeapMeter::Peak() {
    return peakG;
}
void HeapMeter::ResetPeak() {
    peakG = usedG.load();
}

}  // namespace sorntest

#ifndef SORN_HEAP_IS_TAKEN

// The C library's own operations under the names that it keeps for those who put theirs in front.
extern "C" {
void* __libc_malloc(size_t size);
void* __libc_calloc(size_t n, size_t size);
void* __libc_realloc(void* p, size_t size);
void __libc_free(void* p);

void* malloc(size_t size) {
    return sorntest::Count(__libc_malloc(size));
}
void* calloc(size_t n, size_t size) {
    return sorntest::Count(__libc_calloc(n, size));
}
void* realloc(void* p, size_t size) {
    sorntest::Discount(p);
    return sorntest::Count(__libc_realloc(p, size));
}
void free(void* p) {
    sorntest::Discount(p);
    __libc_free(p);
}
}

#endif
