#include "tools/Output.h"

namespace sorn::tools {

bool FinishOutput(std::FILE* file) {
    if (std::fflush(file) == 0 && std::ferror(file) == 0) return true;
    std::fputs("the output could not be written\n", stderr);
    return false;
}

}  // namespace sorn::tools
