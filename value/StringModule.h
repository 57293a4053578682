#pragma once
/// \file
/// The module that holds a string table, as StringCache loads from it.

#include <cstddef>
#include <cstdint>

namespace qv::value {

/// A source of numbered 8-bit texts.
class StringModule {
public:
    virtual ~StringModule() = default;

    /// Copies the text of string `id` into `buffer` of `size` bytes and
    /// returns the number of characters copied, NUL not counted.
    ///
    /// A text longer than size - 1 characters is cut to its first size - 1
    /// characters; the copy is always NUL-terminated when `size` is not 0.
    /// An absent string, a null buffer or a size of 0 gives 0.
    virtual std::size_t LoadString(std::uint32_t id, char* buffer, std::size_t size) const = 0;
};

/// The program's own string table.
class ResourceStringModule final : public StringModule {
public:
    std::size_t LoadString(std::uint32_t id, char* buffer, std::size_t size) const override;
};

/// Copies `length` characters of `text` into `buffer` by the rules of
/// StringModule::LoadString; for implementations of the interface.
std::size_t CopyTruncated(const char* text, std::size_t length, char* buffer, std::size_t size) noexcept;

} // namespace qv::value
