#pragma once
/// \file
/// The client's failure: a refused subscription, with its COM-style status.

#include "fen/Exception.h"

#include <cstdint>

namespace qv::fbfen::orvekclient {

/// Thrown without a source location; callers catch it as
/// qv::fen::exception::Exception and read the status when they need it.
class OCException : public fen::exception::Exception {
public:
    explicit OCException(std::int32_t status) noexcept : status_(status) {}

    /// The status that made the subscription fail; negative.
    std::int32_t GetStatus() const noexcept { return status_; }

private:
    std::int32_t status_;
};

/// Statuses the client produces itself.
inline constexpr std::int32_t kStatusInvalidArgument = static_cast<std::int32_t>(0x80070057u);
inline constexpr std::int32_t kStatusUnspecifiedFailure = static_cast<std::int32_t>(0x80004005u);
inline constexpr std::int32_t kStatusNoInterface = static_cast<std::int32_t>(0x80004002u);

} // namespace qv::fbfen::orvekclient
