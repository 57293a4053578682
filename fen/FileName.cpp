#include "fen/FileName.h"

namespace qv::fen {
namespace {

bool IsLetter(char16_t c) { return (c >= u'A' && c <= u'Z') || (c >= u'a' && c <= u'z'); }

bool IsDriveOnly(const WString& path)
{
    const std::size_t n = path.length();
    if (n < 2 || n > 3 || path[n - 1] != u':')
        return false;
    for (std::size_t i = 0; i + 1 < n; ++i)
        if (!IsLetter(path[i]))
            return false;
    return true;
}

} // namespace

WString FileNamePart(const WString& path)
{
    if (IsDriveOnly(path))
        return WString();
    for (std::size_t i = path.length(); i > 0; --i)
        if (path[i - 1] == u'\\')
            return path.substr(i);
    return path;
}

} // namespace qv::fen
