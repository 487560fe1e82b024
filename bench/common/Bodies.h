#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

/// The texts that the programs measure with.
namespace bench {

/// Texts of which each is the JSON of one record.
using Bodies = std::vector<std::string>;

/// All lines of the example data. Ends the process when there are none.
Bodies ExampleLines();

/// One record (an idSequence) with a list of example records, of about nBytes. The list begins anew with its
/// first record after nBytesOfMix, so that lists of all sizes from there on hold the same mix.
Bodies ListOfRecords(size_t nBytes, size_t nBytesOfMix = SIZE_MAX);

size_t CountBytes(const Bodies& bodies);

}  // namespace bench
