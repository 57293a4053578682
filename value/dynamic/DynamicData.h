#pragma once
/// \file
/// The creators of the storage objects. Each returns a new object holding
/// one reference; callers never pass empty text or bytes (a value without
/// storage stands for those).
///
/// What the objects compute:
/// - Text reads as a number when it is a decimal number ("12.5", " -3e2 "),
///   else 0; as true when it is "true", "on" or "yes" in any letter case or
///   a non-zero number (see TextReading.h). Texts compare by code unit, then
///   by length.
/// - Raw bytes, vectors and dictionaries read as their size and as true when
///   non-empty. Bytes compare byte by byte, vectors element by element,
///   dictionaries entry by entry (key, then value); a shorter one that is a
///   prefix of the other sorts first.
/// - A dictionary orders its keys by the value order (a NaN key after the
///   other numbers, and equal only to another NaN) and shows as
///   "{key: value, ...}", each key and value in its own text form.
/// - A time reads as seconds since the time epoch and as true unless it is
///   the earliest time (no time); times compare chronologically.
/// - A foreign variant reads as the value it holds (0 and false when that
///   cannot be read) and compares by descriptor, then by data.
/// - Flex data holds a copy of one value, reads and compares as that value,
///   and gives it back through its flex-data interface.

#include "value/dynamic/Interfaces.h"

#include <cstdint>

namespace qv::value::dynamic {

IAnsiTextGuts* NewAnsiGuts(const char* text);
IAnsiTextGuts* NewAnsiGutsLen(const char* text, std::uint32_t bytes);
IUnicodeTextGuts* NewUnicodeGuts(const char16_t* text);
IUnicodeTextGuts* NewUnicodeGutsLen(const char16_t* text, std::uint32_t codeUnits);
/// Raw bytes; the object answers kIID_RawBytes.
IGuts* NewRawGuts(const std::uint8_t* bytes, std::uint32_t count);
IVectorGuts* NewVectorGuts();
IDictionaryGuts* NewVarDataDictionary();
/// One time; the same object serves codes 0x100F and 0x1010.
ITimeGuts* NewVarDataSSTimeValue(const fen::AbsTime* time);
IFBVariantGuts* NewVarDataFBVariant(const std::uint16_t* descriptor, std::uint16_t descriptorWords,
                                    const std::uint8_t* data, std::uint32_t dataBytes);
/// Wraps a copy of `value`; the object answers kIID_FlexData.
IGuts* NewVarDataFlexDataFromVarData(const VarData* value);

/// Frees a text returned by IDictionaryGuts::NewText.
void wfd_free(void* text);

} // namespace qv::value::dynamic
