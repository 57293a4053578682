#include "value/StringModule.h"

#include "resources/StringTable.h"

#include <algorithm>
#include <cstring>

namespace qv::value {

std::size_t CopyTruncated(const char* text, std::size_t length, char* buffer, std::size_t size) noexcept
{
    if (buffer == nullptr || size == 0)
        return 0;
    const std::size_t copied = std::min(length, size - 1);
    if (copied != 0)
        std::memcpy(buffer, text, copied);
    buffer[copied] = '\0';
    return copied;
}

std::size_t ResourceStringModule::LoadString(std::uint32_t id, char* buffer, std::size_t size) const
{
    const auto text = resources::FindString(id);
    if (!text)
        return CopyTruncated("", 0, buffer, size);
    return CopyTruncated(text->data(), text->size(), buffer, size);
}

} // namespace qv::value
