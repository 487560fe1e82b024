#include "kelbaselib/Bytesource.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/json/JsonParser.h"

namespace sorn {

ref<Dictionary> Dictionary::FromJsonBytesource(kelbaselib::Bytesource* source, RoxString& error,
                                               RoxMempool* pool) {
    ref<Dictionary> result;
    JsonParser parser(pool);
    parser.BeginParse(result);
    char chunk[512];
    bool isGood = true;
    while (isGood) {
        const unsigned n = source->Read(chunk, sizeof chunk);
        if (n == 0) break;
        isGood = parser.ParseChunk(chunk, n);
    }
    if (isGood) isGood = parser.EndParse();
    if (!isGood) {
        error = RoxString(pool, parser.GetErrorMessage());
        // The parser leaves its words in the pool; here nobody would ever free them.
        parser.EndParse();
        parser.DropErrorMessage();
    }
    source->Release();
    return result;
}

}  // namespace sorn
