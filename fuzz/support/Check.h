#pragma once

/// Ends the process with words, which the fuzzer reports as a finding, unless `isTrue`.
void Check(bool isTrue, const char* words);
