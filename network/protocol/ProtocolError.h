#pragma once
/// \file
/// The failure of a peer's message: bytes that do not follow the Orvek
/// protocol. Every decoder of this folder reports any defect of its input,
/// however deep, as this one exception, and never returns part of a message.

#include "fen/Exception.h"

#include <memory>
#include <string>
#include <utility>

namespace qv::network::protocol {

class ProtocolError : public fen::exception::Exception {
public:
    /// what() gives "protocol error: " followed by `detail`.
    explicit ProtocolError(std::string detail)
        : message_(std::make_shared<const std::string>("protocol error: " + std::move(detail)))
    {
    }

    const char* what() const noexcept override { return message_->c_str(); }
    std::int32_t GetErrorCode() const noexcept override { return static_cast<std::int32_t>(0x8ABC7040u); }

private:
    // Shared, so that copying the exception cannot fail.
    std::shared_ptr<const std::string> message_;
};

} // namespace qv::network::protocol
