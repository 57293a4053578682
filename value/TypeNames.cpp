#include "value/TypeCodes.h"

#include "resources/StringTable.h"

namespace qv::value {

std::uint32_t TypeNameId(std::uint32_t code) noexcept
{
    switch (code & 0xFFFF) {
    case TypeCode::Null: return 497;
    case TypeCode::Logical: return 61281;
    case TypeCode::Numeric: return 61280;
    case TypeCode::Time: return 600;
    case TypeCode::CairnetBreak: return 61287;
    case TypeCode::LogicalPulse: return 61289;
    case TypeCode::AnsiString: return 61284;
    case TypeCode::UnicodeString: return 61285;
    case TypeCode::RawBytes: return 61288;
    case TypeCode::Vector: return 603;
    default: return 61290; // "Undefined"
    }
}

std::string_view TypeName(std::uint32_t code) noexcept
{
    return qv::resources::FindString(TypeNameId(code)).value_or(std::string_view());
}

} // namespace qv::value
