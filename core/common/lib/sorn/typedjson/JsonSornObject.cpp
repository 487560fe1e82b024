#include "sorn/typedjson/JsonSornObject.h"

#include "sorn/model/Schema.h"

namespace sorn {

JsonSornObject::JsonSornObject(RoxMempool* pool)
    : pMempoolM(pool),
      vStructDefM(Schema::vStructDefG),
      nStructDefM(Schema::nStructDefG),
      structListM(nullptr) {}

}  // namespace sorn
