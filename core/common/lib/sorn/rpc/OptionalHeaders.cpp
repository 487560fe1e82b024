#include "sorn/rpc/OptionalHeaders.h"

#include "sorn/rpc/ReservedHeaders.h"

namespace sorn {

const RoxString& ApplicationJson() {
    static const RoxString text(header::applicationJsonG);
    return text;
}

}  // namespace sorn
