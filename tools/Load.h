#pragma once

#include <string>

#include "service/Service.h"

namespace sorn::tools {

/// Stores the records of a file, one a line, many lines together. Standard error tells which lines were not
/// stored, and why. False, and words there, when the file cannot be opened or not be read to its end: what
/// stood before that is stored.
bool LoadFile(service::Service& service, const std::string& path);

}  // namespace sorn::tools
