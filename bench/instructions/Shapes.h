#pragma once

#include <cstddef>
#include <string>

namespace bench {

/// The JSON text of one record of about nBytes:
///   realistic     a list of example records, of the same mix at all sizes
///   string        one long text
///   deep          a record in a record in a record
///   keys          a free-form dictionary with many names
///   objects       many records without fields
///   arrays        many short arrays
///   blanks        long runs of white space between the tokens
///   colliding     names of one length that simple hashes and comparisons of their ends take for the same
/// Empty for a shape of another name.
std::string ShapedText(const std::string& shape, size_t nBytes);

}  // namespace bench
