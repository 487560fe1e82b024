#include "sorn/dict/DictValue.h"

namespace sorn {

const char DictValue::classTagG = 0;

void* DictValue::VkCastHelper(const void* classTag) {
    return classTag == &classTagG ? this : RoxCore::VkCastHelper(classTag);
}

}  // namespace sorn
