#pragma once
/// \file
/// The library's 8-bit and 16-bit strings.
///
/// A string owns one buffer from the task allocator at all times, even when
/// empty, and keeps a NUL after its last character. Every size computation is
/// checked: a length that cannot be represented throws OutOfRange, and an
/// allocation failure throws BadAllocation with the string left as it was.
/// Equality and ordering ignore letter case, in the current locale.

#include "fen/Exception.h"
#include "fen/SafeInteger.h"
#include "fen/TaskAllocator.h"

#include <algorithm>
#include <compare>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <functional>
#include <string_view>
#include <type_traits>

namespace qv::fen {

template <typename CharT>
class BasicString;

/// 8-bit text in the system code page (the locale's charset).
using String = BasicString<char>;
/// 16-bit text (UTF-16 code units).
using WString = BasicString<char16_t>;

namespace detail {

// Converters through the system code page; they throw WinError on text the
// code page cannot represent. Defined with the text conversions.
String NarrowFromWide(const char16_t* begin, const char16_t* end);
WString WideFromNarrow(const char* begin, const char* end);

// Case-ignoring comparison in the current locale: negative, 0 or positive.
int CompareIgnoringCase(std::string_view a, std::string_view b);
int CompareIgnoringCase(std::u16string_view a, std::u16string_view b);

} // namespace detail

template <typename CharT>
class BasicString {
    static_assert(std::is_same_v<CharT, char> || std::is_same_v<CharT, char16_t>);
    using OtherChar = std::conditional_t<std::is_same_v<CharT, char>, char16_t, char>;

public:
    using value_type = CharT;
    /// The index that `find` and `rfind` return when nothing is found.
    static constexpr std::ptrdiff_t npos = -1;
    /// A count or position that means "up to the end".
    static constexpr std::size_t kToEnd = static_cast<std::size_t>(-1);

    BasicString() { Build(nullptr, 0); }
    /// From a NUL-terminated text; null gives the empty string.
    BasicString(const CharT* text) { Build(text, text == nullptr ? 0 : LengthOf(text)); }
    BasicString(const CharT* text, std::size_t length) { Build(text, text == nullptr ? 0 : length); }
    BasicString(std::size_t count, CharT character)
    {
        Build(nullptr, count);
        std::fill(begin_, end_, character);
    }
    /// The characters [from, from + count) of `other`; count is clipped to the end.
    BasicString(const BasicString& other, std::size_t from, std::size_t count)
    {
        CheckPosition(from, other.length());
        Build(other.begin_ + from, Clip(from, count, other.length()));
    }
    BasicString(const BasicString& other) { Build(other.begin_, other.length()); }
    explicit BasicString(std::basic_string_view<CharT> text) { Build(text.data(), text.size()); }

    /// Converts from the other width through the system code page.
    explicit BasicString(const BasicString<OtherChar>& other)
    {
        BasicString converted = Convert(other.c_str(), other.c_str() + other.length());
        swap(converted);
    }
    /// Converts a NUL-terminated text of the other width (null gives the empty string).
    explicit BasicString(const OtherChar* text)
    {
        std::size_t n = 0;
        if (text != nullptr)
            while (text[n] != 0)
                ++n;
        BasicString converted = Convert(text, text + n);
        swap(converted);
    }

    ~BasicString()
    {
        TaskMemFree(begin_);
        begin_ = nullptr;
    }

    BasicString& operator=(const BasicString& other)
    {
        assign(other.begin_, other.length());
        return *this;
    }
    BasicString& operator=(const CharT* text)
    {
        assign(text, text == nullptr ? 0 : LengthOf(text));
        return *this;
    }

    void swap(BasicString& other) noexcept
    {
        std::swap(begin_, other.begin_);
        std::swap(end_, other.end_);
        std::swap(capacityEnd_, other.capacityEnd_);
    }

    const CharT* c_str() const noexcept { return begin_; }
    const CharT* data() const noexcept { return begin_; }
    std::size_t length() const noexcept { return static_cast<std::size_t>(end_ - begin_); }
    std::size_t size() const noexcept { return length(); }
    bool empty() const noexcept { return end_ == begin_; }
    /// Characters that fit without reallocating (the NUL's room not counted).
    std::size_t capacity() const noexcept { return static_cast<std::size_t>(capacityEnd_ - begin_); }
    std::basic_string_view<CharT> View() const noexcept { return {begin_, length()}; }

    const CharT* begin() const noexcept { return begin_; }
    const CharT* end() const noexcept { return end_; }

    /// Bounds-checked: an index at or past the end throws OutOfRange.
    CharT& operator[](std::size_t index)
    {
        CheckIndex(index);
        return begin_[index];
    }
    const CharT& operator[](std::size_t index) const
    {
        CheckIndex(index);
        return begin_[index];
    }

    /// Index of the first `character` at or after `from`, or npos.
    std::ptrdiff_t find(CharT character, std::size_t from = 0) const noexcept
    {
        for (std::size_t i = from; i < length(); ++i)
            if (begin_[i] == character)
                return static_cast<std::ptrdiff_t>(i);
        return npos;
    }

    /// Index of the last occurrence of `text` starting at or before `from`, or npos.
    std::ptrdiff_t rfind(const BasicString& text, std::size_t from = kToEnd) const noexcept
    {
        const std::size_t n = text.length();
        if (n > length())
            return npos;
        std::size_t start = std::min(from, length() - n);
        for (;;) {
            if (std::char_traits<CharT>::compare(begin_ + start, text.begin_, n) == 0)
                return static_cast<std::ptrdiff_t>(start);
            if (start == 0)
                return npos;
            --start;
        }
    }

    /// The characters [from, from + count), count clipped to the end;
    /// `from` past the end throws OutOfRange.
    BasicString substr(std::size_t from, std::size_t count = kToEnd) const
    {
        return BasicString(*this, from, count);
    }

    /// Replaces the text with [text, text + length); null copies the empty text.
    /// The buffer is reallocated to exactly length + 1 elements when the text
    /// does not fit or would use less than half of the capacity.
    void assign(const CharT* text, std::size_t length)
    {
        if (text == nullptr) {
            text = EmptyText();
            length = 0;
        }
        if (text == begin_ && length == this->length())
            return;
        if (Owns(text)) {
            // A part of our own text: move it to the front before any
            // reallocation. Only the characters before the end may be taken;
            // the spare capacity behind it holds nothing.
            const std::size_t available = text <= end_ ? static_cast<std::size_t>(end_ - text) : 0;
            if (available < length)
                QV_THROW(exception::OutOfRange());
            std::memmove(begin_, text, length * sizeof(CharT));
            end_ = begin_ + length;
            *end_ = 0;
            if (2 * length < capacity())
                Reallocate(SafeInteger::FromSize(length));
            return;
        }
        if (length > capacity() || 2 * length < capacity())
            Reallocate(SafeInteger::FromSize(length));
        std::memcpy(begin_, text, length * sizeof(CharT));
        end_ = begin_ + length;
        *end_ = 0;
    }

    BasicString& append(std::size_t count, CharT character)
    {
        GrowForAppend(count);
        std::fill(end_, end_ + count, character);
        end_ += count;
        *end_ = 0;
        return *this;
    }
    BasicString& append(const CharT* text) { return AppendRange(text, text == nullptr ? 0 : LengthOf(text)); }
    BasicString& append(const CharT* text, std::size_t count) { return AppendRange(text, count); }
    BasicString& append(const BasicString& text) { return AppendRange(text.begin_, text.length()); }
    /// Appends [from, from + count) of `text`, count clipped to its end.
    BasicString& append(const BasicString& text, std::size_t from, std::size_t count)
    {
        CheckPosition(from, text.length());
        return AppendRange(text.begin_ + from, Clip(from, count, text.length()));
    }

    BasicString& operator+=(const BasicString& text) { return append(text); }
    BasicString& operator+=(const CharT* text) { return append(text); }
    BasicString& operator+=(CharT character) { return append(1, character); }

    friend BasicString operator+(const BasicString& a, const BasicString& b)
    {
        BasicString result(a);
        result.append(b);
        return result;
    }
    friend BasicString operator+(const BasicString& a, const CharT* b)
    {
        BasicString result(a);
        result.append(b);
        return result;
    }
    friend BasicString operator+(const CharT* a, const BasicString& b)
    {
        BasicString result(a);
        result.append(b);
        return result;
    }

    /// Equality and ordering ignore letter case, in the current locale.
    friend bool operator==(const BasicString& a, const BasicString& b)
    {
        return detail::CompareIgnoringCase(a.View(), b.View()) == 0;
    }
    friend std::weak_ordering operator<=>(const BasicString& a, const BasicString& b)
    {
        int c = detail::CompareIgnoringCase(a.View(), b.View());
        return c < 0 ? std::weak_ordering::less
                     : (c > 0 ? std::weak_ordering::greater : std::weak_ordering::equivalent);
    }

private:
    static const CharT* EmptyText() noexcept
    {
        static const CharT empty = 0;
        return &empty;
    }

    static std::size_t LengthOf(const CharT* text) noexcept
    {
        return std::char_traits<CharT>::length(text);
    }

    static std::size_t Clip(std::size_t from, std::size_t count, std::size_t length) noexcept
    {
        return std::min(count, length - from);
    }

    static void CheckPosition(std::size_t from, std::size_t length)
    {
        if (from > length)
            QV_THROW(exception::OutOfRange());
    }

    void CheckIndex(std::size_t index) const
    {
        if (index >= length())
            QV_THROW(exception::OutOfRange());
    }

    static BasicString Convert(const OtherChar* first, const OtherChar* last)
    {
        if constexpr (std::is_same_v<CharT, char>)
            return detail::NarrowFromWide(first, last);
        else
            return detail::WideFromNarrow(first, last);
    }

    /// Bytes of a buffer of `elements` characters, checked.
    static std::size_t BytesFor(SafeInteger elements)
    {
        if constexpr (sizeof(CharT) == 1)
            return elements.Value();
        else
            return elements.Doubled().Value();
    }

    bool Owns(const CharT* p) const noexcept
    {
        return std::less_equal<const CharT*>()(begin_, p) && std::less_equal<const CharT*>()(p, capacityEnd_);
    }

    /// Allocates a new buffer of exactly length + 1 characters holding
    /// `text`, or left for the caller to fill when `text` is null.
    void Build(const CharT* text, std::size_t length)
    {
        SafeInteger n = SafeInteger::FromSize(length);
        begin_ = static_cast<CharT*>(CheckedAlloc(BytesFor(n + 1)));
        if (text != nullptr && length != 0)
            std::memcpy(begin_, text, length * sizeof(CharT));
        end_ = begin_ + length;
        capacityEnd_ = end_;
        *end_ = 0;
    }

    /// Resizes the buffer to `capacity` + 1 characters, keeping what fits.
    void Reallocate(SafeInteger capacity)
    {
        const std::size_t keep = std::min<std::size_t>(length(), capacity.Value());
        begin_ = static_cast<CharT*>(CheckedRealloc(begin_, BytesFor(capacity + 1)));
        end_ = begin_ + keep;
        capacityEnd_ = begin_ + capacity.Value();
        *end_ = 0;
    }

    /// Makes room for `count` more characters: first twice the needed
    /// capacity, then exactly the needed capacity if that fails.
    void GrowForAppend(std::size_t count)
    {
        if (count <= static_cast<std::size_t>(capacityEnd_ - end_))
            return;
        const std::size_t length = this->length();
        SafeInteger needed = SafeInteger::FromSize(length) + SafeInteger::FromSize(count);
        SafeInteger wanted = needed * 2;
        void* block = TaskMemRealloc(begin_, BytesFor(wanted + 1));
        SafeInteger capacity = wanted;
        if (block == nullptr) {
            block = CheckedRealloc(begin_, BytesFor(needed + 1));
            capacity = needed;
        }
        begin_ = static_cast<CharT*>(block);
        end_ = begin_ + length;
        capacityEnd_ = begin_ + capacity.Value();
    }

    /// Appends [text, text + count); a null text appends nothing.
    BasicString& AppendRange(const CharT* text, std::size_t count)
    {
        if (count == 0 || text == nullptr)
            return *this;
        // The text may be part of our own buffer, which growing can move.
        const bool own = Owns(text);
        const std::size_t offset = own ? static_cast<std::size_t>(text - begin_) : 0;
        GrowForAppend(count);
        if (own)
            text = begin_ + offset;
        std::memmove(end_, text, count * sizeof(CharT));
        end_ += count;
        *end_ = 0;
        return *this;
    }

    CharT* begin_ = nullptr;
    CharT* end_ = nullptr;
    CharT* capacityEnd_ = nullptr;
};

} // namespace qv::fen
