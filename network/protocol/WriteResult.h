#pragma once
/// \file
/// The answer to a write request, sent (not retained) by the owning process
/// to "orvek/v1/<process>/write-result/<path>".
///
///     {"v":1, "id":"monitor-4711-1", "status":0, "text":"written"}
///
/// Every requester of that variable sees every answer and keeps those whose
/// id is its own.

#include <cstdint>
#include <string>
#include <string_view>

namespace qv::network::protocol {

/// Status codes of a write result: 0 for success, negative for failures.
namespace WriteStatus {
inline constexpr std::int32_t Written = 0;
/// Any other failure; the text says what.
inline constexpr std::int32_t Failed = -1;
/// The variable has no write access.
inline constexpr std::int32_t NotWritable = -2;
/// The user may not write the variable.
inline constexpr std::int32_t AccessDenied = -3;
/// The process has no such variable.
inline constexpr std::int32_t NoSuchVariable = -4;
/// The value does not suit the variable.
inline constexpr std::int32_t BadValue = -5;
/// The request could not be read; its id, if any could be read, is kept.
inline constexpr std::int32_t BadRequest = -6;
} // namespace WriteStatus

struct WriteResult {
    /// The request's id; empty only when a BadRequest had none to read.
    std::string id;
    std::int32_t status = WriteStatus::Written;
    /// A human-readable account, possibly empty.
    std::string text;
};

/// The message as UTF-8 JSON; text that is not valid UTF-8 throws InvalidArgument.
std::string EncodeWriteResult(const WriteResult& result);

/// The answer in `payload`: "v", "id" and "status" (signed 32-bit) required,
/// "text" optional, unknown members ignored. Anything malformed throws
/// ProtocolError.
WriteResult DecodeWriteResult(std::string_view payload);

} // namespace qv::network::protocol
