#pragma once

#include <google/protobuf/descriptor.h>
#include <google/protobuf/dynamic_message.h>

#include <memory>
#include <string>

namespace sorntest {

/// The schema as libprotobuf sees it: the generated proto2 file, in the compiled form that the build makes of
/// it. A file that cannot be taken ends the process with words.
class PeerSchema {
 public:
    static PeerSchema& Get();

    /// An empty message of the class of that name.
    std::unique_ptr<google::protobuf::Message> NewMessage(const std::string& name);

 private:
    PeerSchema();

    google::protobuf::DescriptorPool poolM;
    google::protobuf::DynamicMessageFactory factoryM{&poolM};
};

}  // namespace sorntest
