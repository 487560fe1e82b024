#include "fuzz/support/Check.h"

#include <cstdio>
#include <cstdlib>

void Check(bool isTrue, const char* words) {
    if (isTrue) return;
    std::fprintf(stderr, "FINDING: %s\n", words);
    std::abort();
}
