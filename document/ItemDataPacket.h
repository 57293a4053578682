#pragma once
/// \file
/// The record of one monitored item, and the batches in which new items
/// travel from their producers (browser, document file, drop) to the views.

#include "fen/AbsTime.h"
#include "value/TypeCodes.h"
#include "value/VarData.h"

#include <cstdint>
#include <string>
#include <vector>

namespace qv::document {

/// Bits of `ItemDataPacket::access`; other bits carry no meaning here.
namespace AccessBits {
inline constexpr std::uint16_t Read = 0x1;
inline constexpr std::uint16_t Write = 0x2;
} // namespace AccessBits

/// One item of the watch list. Copies are independent, except that they
/// share the value's storage until one of them is assigned a new value.
struct ItemDataPacket {
    ItemDataPacket() = default;
    /// A new record, as every producer makes it.
    ItemDataPacket(std::string url, std::uint16_t dataType, std::uint16_t access)
        : url(std::move(url)), dataType(dataType), access(access)
    {
    }

    /// Full URL of the variable, 8-bit text; the item's identity in a list.
    std::string url;
    /// The variable's type code as the source reported it.
    std::uint16_t dataType = 0;
    /// AccessBits.
    std::uint16_t access = 0;
    /// Last text shown for the value.
    std::string valueText;
    /// Last value received; the NULL type until then.
    value::VarData value = value::VarData::MakeTyped(value::TypeCode::Null);
    /// Last timestamp received; 0.0 seconds until then.
    fen::AbsTime timestamp{0, 0};
    /// Last text shown for the quality.
    std::string qualityText;
};

/// New records from one producer, in the producer's order.
using ItemBatch = std::vector<ItemDataPacket>;

} // namespace qv::document
