#pragma once
/// \file
/// The data that the network browser puts on a drag of variables, and its
/// decoding into new watch-list records.
///
/// The block, all integers little-endian, no padding:
///
///     u32  n                  number of records
///     n times:
///       u16  access           access rights (AccessBits)
///       u16  dataType         the variable's type code
///       u32  kind             record kind; the watch list takes kDropVariableKind only
///       u32  m                length of the URL in UTF-16 code units
///       m × u16               the URL, UTF-16LE, no terminator
///
/// The block ends with the last record; anything else is malformed.

#include "document/ItemDataPacket.h"

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

namespace qv::document {

/// MIME type of the block in a drag.
inline constexpr char kDropMimeType[] = "application/x-varoscope-serialized-data";

/// The one record kind the watch list takes; records of other kinds are the
/// browser's business and are skipped.
inline constexpr std::uint32_t kDropVariableKind = 5;

/// One record of the block.
struct DropRecord {
    std::uint16_t access = 0;
    std::uint16_t dataType = 0;
    std::uint32_t kind = kDropVariableKind;
    std::u16string url;
};

/// The block holding `records` in order.
std::string EncodeDropBlock(std::span<const DropRecord> records);

/// New records for the records of `block` whose kind is kDropVariableKind,
/// in block order, with the URL converted to 8-bit text in the system code
/// page. A malformed block (short, with a count or a length beyond its data,
/// with bytes after the last record) gives an empty batch; nothing is
/// allocated for a count or a length before the data for it is known to be
/// there.
ItemBatch DecodeDropBlock(std::string_view block);

} // namespace qv::document
