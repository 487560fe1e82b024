#pragma once

#include <cstddef>
#include <string>
#include <vector>

/// The texts that the programs measure with.
namespace bench {

/// Texts of which each is one JSON object.
using Bodies = std::vector<std::string>;

/// All lines of the example data. Ends the process when there are none.
Bodies ExampleLines();

/// One object with a list of example records, of about nBytes.
Bodies ListOfRecords(size_t nBytes);

size_t CountBytes(const Bodies& bodies);

}  // namespace bench
