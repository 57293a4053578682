#pragma once
/// \file
/// Interface identifiers of the storage objects.

#include <cstdint>

namespace qv::value::dynamic {

struct Guid {
    std::uint32_t data1;
    std::uint16_t data2;
    std::uint16_t data3;
    std::uint8_t data4[8];

    friend constexpr bool operator==(const Guid&, const Guid&) = default;
};

/// Element access of a vector: {cc498481-9cdc-11d1-9aa3-0000c0fb83d0}.
inline constexpr Guid kIID_VectorElements{0xcc498481, 0x9cdc, 0x11d1, {0x9a, 0xa3, 0x00, 0x00, 0xc0, 0xfb, 0x83, 0xd0}};
/// 8-bit characters of a text: {cc498482-9cdc-11d1-9aa3-0000c0fb83d0}.
inline constexpr Guid kIID_AnsiChars{0xcc498482, 0x9cdc, 0x11d1, {0x9a, 0xa3, 0x00, 0x00, 0xc0, 0xfb, 0x83, 0xd0}};
/// Bytes of a raw block: {dfda5da0-d895-11d1-86bf-00a0246df448}.
inline constexpr Guid kIID_RawBytes{0xdfda5da0, 0xd895, 0x11d1, {0x86, 0xbf, 0x00, 0xa0, 0x24, 0x6d, 0xf4, 0x48}};
/// Unwrapping of flex data: {c1425da3-5c33-4968-9ad8-fbe6517ccae3}.
inline constexpr Guid kIID_FlexData{0xc1425da3, 0x5c33, 0x4968, {0x9a, 0xd8, 0xfb, 0xe6, 0x51, 0x7c, 0xca, 0xe3}};

/// QueryInterface statuses.
inline constexpr std::int32_t kOk = 0;
inline constexpr std::int32_t kNoInterface = static_cast<std::int32_t>(0x80004002u);

} // namespace qv::value::dynamic
