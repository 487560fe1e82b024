#pragma once

#include <google/protobuf/message.h>

#include <memory>
#include <string>

#include "sorn/model/SornObject.h"

namespace sorntest {

/// The object as libprotobuf's KnownDict message, filled by a walk over the metadata that has nothing in
/// common with the binary layer.
std::unique_ptr<google::protobuf::Message> PeerMessage(const sorn::SornObject& object);

/// The record that a KnownDict message holds.
google::protobuf::Message& RecordOf(google::protobuf::Message& knownDict);

/// libprotobuf's bytes of a message.
std::string PeerBytes(const google::protobuf::Message& message);

}  // namespace sorntest
