#include "views/watchlist/RowOrder.h"

#include "fen/Exception.h"
#include "views/watchlist/CellText.h"

#include <cstring>

namespace qv::views {
namespace {

template <typename T>
int Sign(const T& a, const T& b)
{
    return a < b ? -1 : (b < a ? 1 : 0);
}

int CollateSign(const char* a, const char* b)
{
    const int result = std::strcoll(a, b);
    return result < 0 ? -1 : (result > 0 ? 1 : 0);
}

int CompareValues(const value::VarData& a, const value::VarData& b)
{
    try {
        const int result = value::VarData::Compare(a, b);
        return result < 0 ? -1 : (result > 0 ? 1 : 0);
    } catch (const fen::exception::Exception&) {
        // Values the model cannot compare keep their place.
        return 0;
    }
}

} // namespace

int CompareRecords(const document::ItemDataPacket& a, const document::ItemDataPacket& b, int column)
{
    switch (column) {
    case Column::FullName: return CollateSign(a.url.c_str(), b.url.c_str());
    case Column::ShortName:
        return CollateSign(a.url.c_str() + ShortNameStart(a.url), b.url.c_str() + ShortNameStart(b.url));
    case Column::Value:
        if (a.dataType != b.dataType)
            return Sign(a.dataType, b.dataType);
        return CompareValues(a.value, b.value);
    case Column::Time: return Sign(b.timestamp.seconds, a.timestamp.seconds);
    case Column::Quality: return CollateSign(a.qualityText.c_str(), b.qualityText.c_str());
    case Column::Access: return Sign(b.access, a.access);
    default: return 0;
    }
}

std::int32_t SortStateBeforeSort(std::int32_t sortState, int column) noexcept
{
    return sortState == column + kAscendingOffset ? column : kNotSorted;
}

std::int32_t SortStateAfterSort(std::int32_t sortState, int column) noexcept
{
    return sortState == kNotSorted ? column + kAscendingOffset : sortState;
}

} // namespace qv::views
