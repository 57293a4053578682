// Writing a value as a foreign variant. Both passes run the same walk over
// the value; only the data sink differs (counting or storing), so they cannot
// disagree on the sizes. Descriptors are small (bounded by the array
// nesting), so each pass builds its descriptor aside.

#include "value/wfstatic/FBVariantWriter.h"

#include "fen/Exception.h"
#include "value/wfstatic/FBVariantFormat.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstring>
#include <limits>
#include <vector>

namespace qv::value::wfstatic {

namespace {

using fen::exception::BufferOverflow;
using fen::exception::UnableToConvert;
using fen::exception::WithSourceLocation;

constexpr const char* kSource = "wfstatic\\VarDataToFBVariant";

[[noreturn]] void ThrowUnableToConvert(std::int32_t line)
{
    throw WithSourceLocation(UnableToConvert(), kSource, line);
}

[[noreturn]] void ThrowBufferOverflow(std::int32_t line)
{
    throw WithSourceLocation(BufferOverflow(), kSource, line);
}

/// The flattened data: counted in the measuring pass, stored into the
/// caller's buffer in the writing pass.
class DataSink {
public:
    /// A sink that only counts.
    DataSink() noexcept = default;
    /// A sink that stores into `buffer` of `capacity` bytes.
    DataSink(std::uint8_t* buffer, std::uint32_t capacity) noexcept
        : buffer_(buffer), capacity_(capacity), storing_(true)
    {
    }

    template <std::unsigned_integral T>
    void Put(T value)
    {
        if (std::uint8_t* target = Reserve(sizeof(T)))
            StoreBigEndian(target, value);
    }

    void PutBytes(const char* bytes, std::uint32_t count)
    {
        if (std::uint8_t* target = Reserve(count); target != nullptr && count != 0)
            std::memcpy(target, bytes, count);
    }

    std::uint64_t Used() const noexcept { return used_; }

private:
    /// Room for `count` more bytes: where to store them, or null when counting.
    std::uint8_t* Reserve(std::uint64_t count)
    {
        if (!storing_) {
            used_ += count;
            if (used_ > std::numeric_limits<std::uint32_t>::max())
                ThrowUnableToConvert(__LINE__);
            return nullptr;
        }
        if (count > capacity_ - used_)
            ThrowBufferOverflow(__LINE__);
        std::uint8_t* target = buffer_ + used_;
        used_ += count;
        return target;
    }

    std::uint8_t* buffer_ = nullptr;
    std::uint64_t capacity_ = 0;
    std::uint64_t used_ = 0;
    bool storing_ = false;
};

/// `value` as an integer of type T: fractions dropped, limited to T's range,
/// NaN as 0.
template <typename T>
T Saturate(double value) noexcept
{
    constexpr double lowest = static_cast<double>(std::numeric_limits<T>::min());
    constexpr double highest = static_cast<double>(std::numeric_limits<T>::max());
    if (std::isnan(value))
        return 0;
    if (value <= lowest)
        return std::numeric_limits<T>::min();
    if (value >= highest)
        return std::numeric_limits<T>::max();
    return static_cast<T>(value);
}

using Descriptor = std::vector<std::uint16_t>;

void WriteElement(const VarData& value, Descriptor& descriptor, DataSink& data, unsigned nesting);

void WriteNumber(const VarData& value, Descriptor& descriptor, DataSink& data)
{
    double number = 0.0;
    value.GetDouble(number);
    switch (value.Kind()) {
    case NumericKind::Float64:
        descriptor.push_back(FBCode::Float64);
        data.Put(std::bit_cast<std::uint64_t>(number));
        break;
    case NumericKind::Int8:
        descriptor.push_back(FBCode::Int8);
        data.Put(static_cast<std::uint8_t>(Saturate<std::int8_t>(number)));
        break;
    case NumericKind::Int16:
        descriptor.push_back(FBCode::Int16);
        data.Put(static_cast<std::uint16_t>(Saturate<std::int16_t>(number)));
        break;
    case NumericKind::Int32:
        descriptor.push_back(FBCode::Int32);
        data.Put(static_cast<std::uint32_t>(Saturate<std::int32_t>(number)));
        break;
    case NumericKind::UInt8:
        descriptor.push_back(FBCode::UInt8);
        data.Put(Saturate<std::uint8_t>(number));
        break;
    case NumericKind::UInt16:
        descriptor.push_back(FBCode::UInt16);
        data.Put(Saturate<std::uint16_t>(number));
        break;
    case NumericKind::UInt32:
    case NumericKind::BitField:
        descriptor.push_back(FBCode::UInt32);
        data.Put(Saturate<std::uint32_t>(number));
        break;
    case NumericKind::Float32:
        descriptor.push_back(FBCode::Float32);
        data.Put(std::bit_cast<std::uint32_t>(static_cast<float>(number)));
        break;
    default:
        ThrowUnableToConvert(__LINE__);
    }
}

/// Text, Unicode text and raw bytes all go out as 8-bit text.
void WriteString(const VarData& value, Descriptor& descriptor, DataSink& data)
{
    VarData text(value);
    if (text.Code() != TypeCode::AnsiString)
        text.ConvertTo(TypeCode::AnsiString);
    const char* chars = nullptr;
    if (!text.GetAnsiText(chars))
        ThrowUnableToConvert(__LINE__);
    const std::uint32_t count = text.Size();
    descriptor.insert(descriptor.end(), {FBCode::String, kFBVariableDimension, kFBVariableDimension});
    data.Put(count);
    data.PutBytes(chars, count);
}

void WriteTime(const VarData& value, Descriptor& descriptor, DataSink& data)
{
    fen::AbsTime time{};
    if (!value.GetTime(time))
        ThrowUnableToConvert(__LINE__);
    descriptor.push_back(FBCode::TimeStamp);
    // One 128-bit number, most significant word first: seconds, then fraction.
    data.Put(static_cast<std::uint64_t>(time.seconds));
    data.Put(time.fraction);
}

/// Element 0 gives the element descriptor; every other element must have
/// exactly the same one.
void WriteArray(const VarData& value, Descriptor& descriptor, DataSink& data, unsigned nesting)
{
    if (nesting >= kFBMaxArrayNesting)
        ThrowUnableToConvert(__LINE__);
    const std::uint32_t count = value.Size();
    if (count == 0)
        ThrowUnableToConvert(__LINE__);
    descriptor.insert(descriptor.end(), {FBCode::Array, 1, kFBVariableDimension, kFBVariableDimension});
    data.Put(count);

    const std::size_t elementStart = descriptor.size();
    WriteElement(value.GetElement(0), descriptor, data, nesting + 1);
    Descriptor other;
    for (std::uint32_t i = 1; i < count; ++i) {
        other.clear();
        WriteElement(value.GetElement(i), other, data, nesting + 1);
        if (!std::equal(other.begin(), other.end(), descriptor.begin() + elementStart, descriptor.end()))
            ThrowUnableToConvert(__LINE__);
    }
}

/// Appends the element's descriptor (size word, type word, type-specific
/// words) to `descriptor` and its data to `data`.
void WriteElement(const VarData& value, Descriptor& descriptor, DataSink& data, unsigned nesting)
{
    const std::size_t start = descriptor.size();
    descriptor.push_back(0);
    switch (value.Code()) {
    case TypeCode::Null:
        descriptor.push_back(FBCode::Void);
        break;
    case TypeCode::Logical: {
        bool logical = false;
        value.GetBool(logical);
        descriptor.push_back(FBCode::Boolean);
        data.Put(static_cast<std::uint8_t>(logical ? 1 : 0));
        break;
    }
    case TypeCode::Numeric:
        WriteNumber(value, descriptor, data);
        break;
    case TypeCode::AnsiString:
    case TypeCode::UnicodeString:
    case TypeCode::RawBytes:
        WriteString(value, descriptor, data);
        break;
    case TypeCode::Vector:
        WriteArray(value, descriptor, data, nesting);
        break;
    case TypeCode::SSTimeValue:
        WriteTime(value, descriptor, data);
        break;
    default:
        ThrowUnableToConvert(__LINE__);
    }
    const std::size_t bytes = (descriptor.size() - start) * sizeof(std::uint16_t);
    if (bytes > std::numeric_limits<std::uint16_t>::max())
        ThrowUnableToConvert(__LINE__);
    descriptor[start] = static_cast<std::uint16_t>(bytes);
}

} // namespace

FBVariantSizes MeasureFBVariant(const VarData& value)
{
    Descriptor descriptor;
    DataSink data;
    WriteElement(value, descriptor, data, 0);
    return {static_cast<std::uint32_t>(descriptor.size()), static_cast<std::uint32_t>(data.Used())};
}

void WriteFBVariant(const VarData& value, std::uint16_t* descriptor, std::uint32_t descriptorWords,
                    std::uint8_t* data, std::uint32_t dataBytes)
{
    Descriptor words;
    DataSink sink(data, dataBytes);
    WriteElement(value, words, sink, 0);
    if (words.size() > descriptorWords)
        ThrowBufferOverflow(__LINE__);
    std::copy(words.begin(), words.end(), descriptor);
}

} // namespace qv::value::wfstatic
