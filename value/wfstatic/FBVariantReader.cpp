// Reading a foreign variant: one element descriptor at a time, recursing
// into arrays, with every read checked against the two given ranges.

#include "value/wfstatic/FBVariantReader.h"

#include "fen/Exception.h"
#include "fen/SyntaxError.h"
#include "value/wfstatic/FBVariantFormat.h"

#include <bit>
#include <cstddef>

namespace qv::value::wfstatic {

namespace {

using fen::exception::SyntaxError;
using fen::exception::UnableToConvert;
using fen::exception::WithSourceLocation;

constexpr const char* kSource = "wfstatic\\FBVariantToVarData";

/// Arrays of void elements cost memory but no data bytes; this many Null
/// elements in one value are the most that a read builds.
constexpr std::uint32_t kMaxVoidElements = 1u << 20;

[[noreturn]] void ThrowSyntaxError(std::int32_t line)
{
    throw WithSourceLocation(SyntaxError(), kSource, line);
}

[[noreturn]] void ThrowUnableToConvert(std::int32_t line)
{
    throw WithSourceLocation(UnableToConvert(), kSource, line);
}

/// The fewest data bytes that one element of type `code` takes.
std::size_t MinimumDataBytes(std::uint8_t code) noexcept
{
    switch (code) {
    case FBCode::Int8:
    case FBCode::UInt8:
    case FBCode::Boolean:
        return 1;
    case FBCode::Int16:
    case FBCode::UInt16:
        return 2;
    case FBCode::Int32:
    case FBCode::UInt32:
    case FBCode::Float32:
    case FBCode::String:
    case FBCode::Array:
        return 4;
    case FBCode::Float64:
        return 8;
    case FBCode::TimeStamp:
        return 16;
    default:
        return 0;
    }
}

class Reader {
public:
    Reader(const std::uint16_t* descriptor, std::size_t descriptorWords, const std::uint8_t* data,
           std::size_t dataBytes) noexcept
        : descriptor_(descriptor), descriptorWords_(descriptorWords), data_(data), dataBytes_(dataBytes)
    {
    }

    /// Reads the element whose descriptor starts at the current position and
    /// leaves the position at the end of that descriptor. `nesting` counts
    /// the arrays around the element.
    VarData ReadElement(unsigned nesting)
    {
        const std::size_t end = ElementEnd();
        const std::uint16_t typeWord = NextWord();
        VarData value = ReadBody(static_cast<std::uint8_t>(typeWord & 0xFF), nesting);
        if ((typeWord & kFBNameFlag) != 0)
            SkipName();
        if (end < position_)
            ThrowSyntaxError(__LINE__);
        position_ = end;
        return value;
    }

private:
    /// Reads the size word of the element starting at the current position
    /// and gives where its descriptor ends. An odd size is rounded up to a
    /// whole word, the padding after a name.
    std::size_t ElementEnd()
    {
        const std::size_t start = position_;
        const std::uint16_t sizeBytes = NextWord();
        if (sizeBytes == 0)
            ThrowSyntaxError(__LINE__);
        const std::size_t end = start + (std::size_t{sizeBytes} + 1) / 2;
        if (end > descriptorWords_)
            ThrowSyntaxError(__LINE__);
        return end;
    }

    VarData ReadBody(std::uint8_t code, unsigned nesting)
    {
        switch (code) {
        case FBCode::Void:
            return VarData::MakeTyped(TypeCode::Null);
        case FBCode::Int8:
            return Number(static_cast<std::int8_t>(Next<std::uint8_t>()), NumericKind::Int8);
        case FBCode::Int16:
            return Number(static_cast<std::int16_t>(Next<std::uint16_t>()), NumericKind::Int16);
        case FBCode::Int32:
            return Number(static_cast<std::int32_t>(Next<std::uint32_t>()), NumericKind::Int32);
        case FBCode::UInt8:
            return Number(Next<std::uint8_t>(), NumericKind::UInt8);
        case FBCode::UInt16:
            return Number(Next<std::uint16_t>(), NumericKind::UInt16);
        case FBCode::UInt32:
            return Number(Next<std::uint32_t>(), NumericKind::UInt32);
        case FBCode::Float32:
            return Number(std::bit_cast<float>(Next<std::uint32_t>()), NumericKind::Float32);
        case FBCode::Float64:
            return Number(std::bit_cast<double>(Next<std::uint64_t>()), NumericKind::Float64);
        case FBCode::Boolean:
            return VarData::MakeLogical(Next<std::uint8_t>() != 0);
        case FBCode::String:
            return ReadString();
        case FBCode::Array:
            return ReadArray(nesting);
        case FBCode::TimeStamp:
            return ReadTime();
        default:
            ThrowUnableToConvert(__LINE__);
        }
    }

    static VarData Number(double value, NumericKind kind) noexcept
    {
        return VarData::MakeNumeric(value, static_cast<std::uint16_t>(kind));
    }

    VarData ReadString()
    {
        ExpectVariableDimension();
        const std::uint32_t count = Next<std::uint32_t>();
        const std::uint8_t* bytes = TakeBytes(count);
        return VarData::MakeAnsi(reinterpret_cast<const char*>(bytes), count);
    }

    VarData ReadTime()
    {
        // One 128-bit number, most significant word first: seconds, then fraction.
        const std::uint64_t seconds = Next<std::uint64_t>();
        const std::uint64_t fraction = Next<std::uint64_t>();
        return VarData(fen::AbsTime{fraction, static_cast<std::int64_t>(seconds)});
    }

    VarData ReadArray(unsigned nesting)
    {
        if (nesting >= kFBMaxArrayNesting)
            ThrowSyntaxError(__LINE__);
        if (NextWord() != 1)
            ThrowUnableToConvert(__LINE__);
        ExpectVariableDimension();
        const std::uint32_t count = Next<std::uint32_t>();
        if (count == 0)
            return VarData::MakeTyped(TypeCode::Null);
        const std::size_t elementStart = position_;

        VarData elements;
        elements.SetElement(0, ReadElement(nesting + 1));
        // Element 0 has shown the descriptor to be sound; before building the
        // others, make sure the data can hold them.
        CheckRoomForElements(count - 1, descriptor_[elementStart + 1]);
        for (std::uint32_t i = 1; i < count; ++i) {
            position_ = elementStart;
            elements.SetElement(i, ReadElement(nesting + 1));
        }
        return elements;
    }

    void CheckRoomForElements(std::uint32_t count, std::uint16_t elementTypeWord)
    {
        const std::uint8_t code = static_cast<std::uint8_t>(elementTypeWord & 0xFF);
        if (const std::size_t least = MinimumDataBytes(code); least != 0) {
            if (count > (dataBytes_ - dataPosition_) / least)
                ThrowSyntaxError(__LINE__);
        } else if (code == FBCode::Void) {
            if (count > voidBudget_)
                ThrowUnableToConvert(__LINE__);
            voidBudget_ -= count;
        }
    }

    void ExpectVariableDimension()
    {
        const std::uint16_t first = NextWord();
        const std::uint16_t second = NextWord();
        if (first != kFBVariableDimension || second != kFBVariableDimension)
            ThrowUnableToConvert(__LINE__);
    }

    /// A length byte in the high half of the first word, then the characters,
    /// padded to a whole word. Names are not kept; a name that reaches past
    /// its element is caught by the caller's end check.
    void SkipName()
    {
        const std::size_t length = NextWord() >> 8;
        position_ += (1 + length + 1) / 2 - 1;
    }

    std::uint16_t NextWord()
    {
        if (position_ >= descriptorWords_)
            ThrowSyntaxError(__LINE__);
        return descriptor_[position_++];
    }

    const std::uint8_t* TakeBytes(std::size_t count)
    {
        if (count > dataBytes_ - dataPosition_)
            ThrowSyntaxError(__LINE__);
        const std::uint8_t* bytes = data_ + dataPosition_;
        dataPosition_ += count;
        return bytes;
    }

    template <typename T>
    T Next()
    {
        return LoadBigEndian<T>(TakeBytes(sizeof(T)));
    }

    const std::uint16_t* descriptor_;
    std::size_t descriptorWords_;
    std::size_t position_ = 0;
    const std::uint8_t* data_;
    std::size_t dataBytes_;
    std::size_t dataPosition_ = 0;
    std::uint32_t voidBudget_ = kMaxVoidElements;
};

template <typename T>
std::size_t Span(const T* begin, const T* end) noexcept
{
    return begin != nullptr && end > begin ? static_cast<std::size_t>(end - begin) : 0;
}

} // namespace

VarData FBVariantToVarData(const std::uint16_t* descriptorBegin, const std::uint16_t* descriptorEnd,
                           const std::uint8_t* dataBegin, const std::uint8_t* dataEnd)
{
    Reader reader(descriptorBegin, Span(descriptorBegin, descriptorEnd), dataBegin, Span(dataBegin, dataEnd));
    return reader.ReadElement(0);
}

} // namespace qv::value::wfstatic
