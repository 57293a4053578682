#pragma once
/// \file
/// Text that breaks a grammar: "SyntaxError", or "SyntaxError: " and a detail.

#include "fen/Exception.h"
#include "fen/String.h"

namespace qv::fen::exception {

class SyntaxError : public Exception {
public:
    /// An empty detail gives "SyntaxError"; otherwise "SyntaxError: " followed
    /// by the detail in the system code page (characters it cannot represent
    /// become '?').
    explicit SyntaxError(const WString& detail = WString());

    const char* what() const noexcept override { return message_.c_str(); }
    std::int32_t GetErrorCode() const noexcept override
    {
        return static_cast<std::int32_t>(0x8ABC7004u);
    }

private:
    String message_;
};

} // namespace qv::fen::exception
