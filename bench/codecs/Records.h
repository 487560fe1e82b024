#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "common/Bodies.h"
#include "rox/RoxMempool.h"
#include "rox/ref.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/model/SornObject.h"

namespace bench {

/// One record in all forms that the libraries read.
struct Record {
    ref<sorn::SornObject> object;  ///< as the binary reader makes it, like the peers' trees
    ref<rox::ByteBuffer> binary;   ///< the same bytes for all libraries
    std::string text;              ///< the typed writer's, the same for all but libprotobuf
    std::string peerText;          ///< libprotobuf's own JSON of the same record
};

/// A set of records. All forms of each are checked against each other when it is made: the process ends with
/// words when two libraries disagree about a record.
class Records {
 public:
    /// The bodies are JSON of records.
    Records(std::string name, const Bodies& bodies);

    const std::string& Name() const { return nameM; }
    const std::vector<Record>& All() const { return recordsM; }
    size_t BinaryBytes() const { return nBinaryM; }
    size_t TextBytes() const { return nTextM; }
    size_t PeerTextBytes() const { return nPeerTextM; }

 private:
    Record MakeRecord(const std::string& body);

    std::string nameM;
    RoxMempool poolM{"records"};
    RoxMempool treesM{"trees"};  ///< of the objects alone, as the peers' trees have their arena
    std::vector<Record> recordsM;
    size_t nBinaryM = 0;
    size_t nTextM = 0;
    size_t nPeerTextM = 0;
};

}  // namespace bench
