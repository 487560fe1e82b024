#pragma once

#include <google/protobuf/arena.h>
#include <google/protobuf/dynamic_message.h>
#include <google/protobuf/message.h>
#include <rapidjson/document.h>

#include <cstddef>
#include <string>

#include "codecs/Records.h"
#include "sorn/model/SornObject.h"

/// The libraries under one face: what `From...` gives is the library's tree of a record, null or empty when
/// the input was refused; `Done` ends its life. What `To...` gives is a new value, made anew each time.
namespace bench {

/// This library: objects in a pool.
class Sorn {
 public:
    using Tree = ref<sorn::SornObject>;

    explicit Sorn(RoxMempool& pool) : poolM(pool) {}

    Tree FromBinary(const Record& record);
    Tree FromText(const Record& record);
    ref<rox::ByteBuffer> ToBinary(const Tree& tree);
    std::string ToText(const Tree& tree);
    /// The text's length; the text itself lives no longer.
    size_t WriteText(const Tree& tree);

 private:
    RoxMempool& poolM;
};

/// libprotobuf: messages on an arena.
class Peer {
 public:
    enum class Form {
        GENERATED,  ///< generated classes, a known dict with one optional field per struct
        ONEOF,      ///< the same with those fields in a oneof: smaller and faster
        DYNAMIC,    ///< messages driven by tables
    };
    using Tree = google::protobuf::Message*;

    /// The arena starts with a block of nBlock bytes and keeps it, so that most records need no more of the
    /// heap.
    explicit Peer(Form form, size_t nBlock = 256 << 10);

    Tree FromBinary(const Record& record);
    Tree FromText(const Record& record);
    static std::string ToBinary(const google::protobuf::Message& tree) { return tree.SerializeAsString(); }
    static size_t WriteText(const google::protobuf::Message& tree);
    /// All trees so far are gone.
    void Done() { arenaM.Reset(); }
    /// On the arena alone: texts of more than a few bytes lie on the heap.
    size_t ArenaBytes() const { return arenaM.SpaceUsed(); }

 private:
    static const google::protobuf::Message& Prototype(Form form,
                                                      google::protobuf::DynamicMessageFactory& factory);
    static google::protobuf::ArenaOptions Options(std::string& block);

    std::string blockM;
    google::protobuf::Arena arenaM;
    google::protobuf::DynamicMessageFactory factoryM;
    const google::protobuf::Message& prototypeM;
};

/// RapidJSON's trees, without types.
class RapidJson {
 public:
    using Tree = rapidjson::Document;

    static Tree FromText(const Record& record);
    static size_t WriteText(const Tree& tree);
};

}  // namespace bench
