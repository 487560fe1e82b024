#pragma once

namespace sorn {

class ProtoBufByteOutputStream;

/// The integers of the binary form: little-endian groups of seven bits, the top bit of a byte set when
/// another one follows; signed ones by zigzag (0, -1, 1, -2 become 0, 1, 2, 3). These are the varints of
/// Protocol Buffers.
///
/// Writers give the shortest form. Readers take longer ones too, up to 5 bytes for 32 bits and 10 for 64, and
/// drop bits above the width. A reader moves the cursor behind the number and gives true; when there is no
/// number before `end`, or a longer one, it gives false and leaves cursor and result alone.
class GoogleInt {
 public:
    static void WriteGoogleU32(unsigned value, ProtoBufByteOutputStream& stream);
    static void WriteGoogleS32(int value, ProtoBufByteOutputStream& stream);
    static void WriteGoogleU64(unsigned long long value, ProtoBufByteOutputStream& stream);
    static void WriteGoogleS64(long long value, ProtoBufByteOutputStream& stream);

    static bool ReadGoogleU32(const unsigned char** cursor, const unsigned char* end, unsigned* out);
    static bool ReadGoogleS32(const unsigned char** cursor, const unsigned char* end, int* out);
    static bool ReadGoogleU64(const unsigned char** cursor, const unsigned char* end,
                              unsigned long long* out);
    static bool ReadGoogleS64(const unsigned char** cursor, const unsigned char* end, long long* out);
};

}  // namespace sorn
