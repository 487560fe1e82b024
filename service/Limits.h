#pragma once

#include <cstddef>
#include <cstdint>

namespace sorn::service {

/// What a client can make the service hold and do; docs/service.md tells why. The bus has limits of its own:
/// sessions, bytes of a message, and bytes that wait for a client which does not read.
struct Limits {
    /// Most records in one list: a list of more cannot be read into an object.
    uint32_t maxListRecords = 65'535;
    /// Bytes of the text of one answer: the largest body of a message.
    uint32_t maxAnswerBytes = 0x500000;
    /// Open streams of one session, and of all sessions together.
    size_t maxSessionStreams = 10'000;
    size_t maxStreams = 20'000;
    /// Bytes that one query may take, and those of all open streams together.
    size_t maxQueryBytes = 64u << 10;
    size_t maxStreamQueryBytes = 32u << 20;
    /// Objects that one query may compare with.
    size_t maxQueryObjects = 64;
    /// Bytes of the text of one record: a list of it alone is an answer.
    size_t maxRecordBytes = 0x500000 - 1024;
    /// Records of one type.
    size_t maxTypeRecords = 1'000'000;
    /// Bytes of decoded records kept for comparison; others are read again each time.
    size_t maxDecodedBytes = 128u << 20;
    /// Messages to open streams that are sent before others are served again, and bytes of them.
    size_t maxTurnMessages = 64;
    size_t maxTurnBytes = 1u << 20;
    /// Nanoseconds after which a turn begins no further list or message: a list looks at all records of its
    /// type.
    int64_t maxTurnNanoseconds = 20'000'000;
};

/// Bytes of the whole store; records for which there is no room are refused.
constexpr int64_t maxStoreBytesG = int64_t{4} << 30;

}  // namespace sorn::service
