#include "peer/PeerSchema.h"

#include <google/protobuf/descriptor.pb.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>

namespace sorntest {

PeerSchema& PeerSchema::Get() {
    static PeerSchema schema;
    return schema;
}

PeerSchema::PeerSchema() {
    std::ifstream in(SORN_PEER_SCHEMA, std::ios::binary);
    google::protobuf::FileDescriptorSet files;
    if (files.ParseFromIstream(&in) && files.file_size() == 1 && poolM.BuildFile(files.file(0)) != nullptr)
        return;
    std::fprintf(stderr, "%s holds no schema\n", SORN_PEER_SCHEMA);
    std::exit(1);
}

std::unique_ptr<google::protobuf::Message> PeerSchema::NewMessage(const std::string& name) {
    const google::protobuf::Descriptor* type = poolM.FindMessageTypeByName("everytype." + name);
    if (type == nullptr) {
        std::fprintf(stderr, "no message %s\n", name.c_str());
        std::exit(1);
    }
    return std::unique_ptr<google::protobuf::Message>(factoryM.GetPrototype(type)->New());
}

}  // namespace sorntest
