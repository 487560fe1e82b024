#pragma once

#include <cstdint>
#include <string>
#include <utility>

namespace sorn::service {

/// Values of the enumeration errorCode that answers use.
struct ErrorCode {
    static constexpr uint32_t badArgumentG = 3;
    static constexpr uint32_t internalErrorG = 5;
    static constexpr uint32_t schemaExceptionG = 12;
    static constexpr uint32_t objectNotFoundG = 15;
    static constexpr uint32_t resourceUnavailableG = 17;
    static constexpr uint32_t serverBusyG = 27;
};

/// Why a request was not done: what its answer, a record of type "error", says.
struct Failure {
    uint32_t code = 0;  // of ErrorCode
    std::string text;

    /// Sets both; false, for the caller to return.
    bool Set(uint32_t newCode, std::string newText) {
        code = newCode;
        text = std::move(newText);
        return false;
    }
};

}  // namespace sorn::service
