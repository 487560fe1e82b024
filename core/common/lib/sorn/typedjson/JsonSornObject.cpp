#include "sorn/typedjson/JsonSornObject.h"
