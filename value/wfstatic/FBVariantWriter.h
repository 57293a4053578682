#pragma once
/// \file
/// Writes a native value out as a foreign variant, in two passes: one
/// measures, the caller allocates zeroed buffers of exactly those sizes, the
/// other writes.

#include "value/VarData.h"

#include <cstdint>

namespace qv::value::wfstatic {

/// Sizes of a flattened value.
struct FBVariantSizes {
    std::uint32_t descriptorWords = 0;
    std::uint32_t dataBytes = 0;
};

/// The measuring pass. Throws UnableToConvert for a value that cannot be
/// flattened.
FBVariantSizes MeasureFBVariant(const VarData& value);

/// The writing pass. Throws UnableToConvert as the measuring pass does and
/// BufferOverflow when a buffer is too small. No element names are written.
void WriteFBVariant(const VarData& value, std::uint16_t* descriptor, std::uint32_t descriptorWords,
                    std::uint8_t* data, std::uint32_t dataBytes);

} // namespace qv::value::wfstatic
