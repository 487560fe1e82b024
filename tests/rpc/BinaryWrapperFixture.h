#pragma once

#include <string>

#include "binary/BinaryFixture.h"
#include "sorn/lazy/LazyDict.h"
#include "sornschema/Error.h"
#include "sornschema/OrvoRpcCancel.h"
#include "sornschema/OrvoRpcHello.h"
#include "sornschema/OrvoRpcRequest.h"
#include "sornschema/OrvoRpcResponse.h"

namespace sorntest {

// Struct tags: ids 974, 975, 976 and 1449 times 8 plus 2 are 7794, 7802, 7810 and 11594.
inline constexpr char cancelTagG[] = "F2 3C ";
inline constexpr char requestTagG[] = "FA 3C ";
inline constexpr char responseTagG[] = "82 3D ";
inline constexpr char helloTagG[] = "CA 5A ";

// A body of struct 5919, whose tag 47354 is FA F1 02: label (slot 6, 32) "x", number (slot 7, 38) -2.
inline constexpr char bodyG[] = "FA F1 02 05 32 01 78 38 03 ";
inline constexpr char bodyJsonG[] = R"({"label": "x", "number": -2, "type": "everyTypeCompanion"})";
// The same struct without fields, as the field of a request and of a response.
inline constexpr char emptyBodyFieldG[] = "12 04 FA F1 02 00 ";
inline constexpr char emptyBodyJsonG[] = R"({"type": "everyTypeCompanion"})";

// What a bad request or response is read as.
inline constexpr char badG[] = "error 3: wrapper did not unmarshal";
inline constexpr char badLengthG[] = "error 3: wrapper did not unmarshal: length";

/// Messages of the older form as bytes, and a line of text that tells all that one was read as.
class BinaryWrapperFixture : public BinaryFixture {
 protected:
    /// Struct tag, length and fields.
    static std::string Message(const char* tag, const std::string& fields) {
        return Bytes(tag) + Section(fields);
    }

    /// The message that the bytes are read as, from a block of exactly their size; nothing stays behind.
    std::string Read(const std::string& bytes) {
        const size_t nBefore = pool.GetUsedBytes();
        const ExactBytes exact(bytes);
        const std::string shown = Shown(Codec().UnmarshalWrapper(exact.Begin(), exact.Size()));
        EXPECT_EQ(pool.GetUsedBytes(), nBefore);
        return shown;
    }
    std::string ReadHex(const std::string& hex) { return Read(Bytes(hex)); }
    /// A request or response of the fields given as hex.
    std::string Request(const std::string& fields) { return Read(Message(requestTagG, Bytes(fields))); }
    std::string Response(const std::string& fields) { return Read(Message(responseTagG, Bytes(fields))); }
    /// The line of a request or response with an empty body.
    static std::string Line(const std::string& before) { return before + " body=" + emptyBodyJsonG; }

    static std::string Shown(const ref<sorn::SornObject>& object);
    static std::string ShownError(const sorn::SornObject& object);
    static std::string ShownBody(const ref<sorn::LazyDict>& body);
    /// The object that a body is made of.
    static std::string ShownObject(const ref<sorn::SornObject>& object) {
        return object->structId == sornschema::Error::structIdG ? ShownError(*object)
                                                                : Text(object->ToString(false, 0));
    }
};

inline std::string BinaryWrapperFixture::ShownError(const sorn::SornObject& object) {
    const auto& error = static_cast<const sornschema::Error&>(object);
    return "error " + std::to_string(error.code) + ": " + Text(error.text);
}

inline std::string BinaryWrapperFixture::ShownBody(const ref<sorn::LazyDict>& body) {
    if (body == nullptr) return "none";
    EXPECT_EQ(body->GetRep(), sorn::LazyDict::REP_OBJECT);
    EXPECT_TRUE(body->GetVersion().FAbsent());
    return ShownObject(body->GetStoredObject());
}

inline std::string BinaryWrapperFixture::Shown(const ref<sorn::SornObject>& object) {
    if (object == nullptr) return "null";
    switch (object->structId) {
        case sornschema::Error::structIdG:
            return ShownError(*object);
        case sornschema::OrvoRpcRequest::structIdG: {
            const auto& request = static_cast<const sornschema::OrvoRpcRequest&>(*object);
            EXPECT_EQ(request.headers, nullptr);
            return "request monitor=" + std::to_string(request.monitorFutureChanges) +
                   " rpcId=" + std::to_string(request.rpcId) +
                   " version=" + std::to_string(request.orvoVersion) +
                   " partner=" + (request.partnerId_isSet != 0 ? std::to_string(request.partnerId) : "-") +
                   " forget=" +
                   (request.sendAndForget_isSet != 0 ? std::to_string(request.sendAndForget) : "-") +
                   " body=" + ShownBody(request.request);
        }
        case sornschema::OrvoRpcResponse::structIdG: {
            const auto& response = static_cast<const sornschema::OrvoRpcResponse&>(*object);
            EXPECT_EQ(response.headers, nullptr);
            EXPECT_EQ(response.orvoVersion_isSet, 0);
            return "response final=" + std::to_string(response.isFinalResponse) +
                   " rpcId=" + std::to_string(response.rpcId) + " body=" + ShownBody(response.response);
        }
        default:
            return Text(object->ToString(false, 0));
    }
}

}  // namespace sorntest
