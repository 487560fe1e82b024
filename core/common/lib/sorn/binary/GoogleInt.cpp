#include "sorn/binary/GoogleInt.h"
