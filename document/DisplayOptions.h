#pragma once
/// \file
/// The watch list's display options, kept between runs in the options file.

#include <cstdint>

namespace qv::document {

struct DisplayOptions {
    /// Reopen the last watch list at start-up.
    bool autoloadLastView = false;
    /// Show "XXXXX" instead of the value while the quality is bad.
    bool xxForBadQuality = false;
    /// Warn before writing a text that is not a number to a numeric item.
    bool typeMismatchWarning = true;
    /// Show raw bytes as hexadecimal digits.
    bool hexForRawData = false;
    /// Significant digits of numeric values, 1 to 12.
    std::uint32_t decimalDigits = 12;
    /// Bit n set: column n (0 to 5) is shown.
    std::uint8_t columnMask = 0x3F;

    friend bool operator==(const DisplayOptions&, const DisplayOptions&) = default;
};

} // namespace qv::document
