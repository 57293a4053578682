#pragma once
/// \file
/// Reads a foreign variant (type descriptor words and flattened big-endian
/// data) into a native value.

#include "value/VarData.h"

#include <cstdint>

namespace qv::value::wfstatic {

/// The value described by [descriptorBegin, descriptorEnd) holding the data
/// [dataBegin, dataEnd). Element names are read and dropped.
///
/// Throws SyntaxError when the descriptor or the data run out or an element
/// descriptor's size is 0 or reaches outside the descriptor, and
/// UnableToConvert for a type or an array shape it does not read.
VarData FBVariantToVarData(const std::uint16_t* descriptorBegin, const std::uint16_t* descriptorEnd,
                           const std::uint8_t* dataBegin, const std::uint8_t* dataEnd);

} // namespace qv::value::wfstatic
