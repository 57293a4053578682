#pragma once
/// \file
/// The value of one network variable: a small tagged variant that is copied
/// freely between threads and layers.
///
/// Simple values (logical, number, 64-bit counts) live inside it; text, raw
/// bytes, vectors, dictionaries, times and wrapped foreign values live in a
/// reference-counted storage object that copies share. Writing into a vector
/// or a dictionary first makes its storage unshared (copy on write).
///
/// Layout: the type word (code in bits 0-15, sub-type such as the numeric
/// kind in bits 16-31), then an 8-byte payload. On 64-bit hosts the payload
/// is 8-byte aligned, so the value takes 16 bytes.

#include "fen/AbsTime.h"
#include "fen/String.h"
#include "value/TypeCodes.h"

#include <cstdint>
#include <utility>

namespace qv::value {

namespace dynamic {
class IGuts;
class IDictionaryIterator;
} // namespace dynamic

class VarData;

/// Owns one dictionary iterator and destroys it with itself. Key and Value
/// may be read only before the iterator reaches End. A walk keeps the
/// entries it started on: writing into the dictionary meanwhile gives the
/// value new storage, and the walk still ends when compared with the
/// value's End.
class DictionaryIterator {
public:
    explicit DictionaryIterator(dynamic::IDictionaryIterator* iterator) noexcept : iterator_(iterator) {}
    DictionaryIterator(const DictionaryIterator& other);
    DictionaryIterator& operator=(const DictionaryIterator& other);
    ~DictionaryIterator();

    friend bool operator!=(const DictionaryIterator& a, const DictionaryIterator& b);
    DictionaryIterator& operator++();
    const VarData& Key() const;
    const VarData& Value() const;

private:
    dynamic::IDictionaryIterator* iterator_;
};

class VarData {
public:
    /// An Empty value.
    VarData() noexcept : type_(TypeCode::Empty) { payload_.count = 0; }
    /// AnsiString; null or empty text holds no storage.
    VarData(const char* text);
    VarData(const fen::String& text);
    /// UnicodeString; null or empty text holds no storage.
    VarData(const char16_t* text);
    VarData(const fen::WString& text);
    /// RawBytes; null or no bytes hold no storage.
    VarData(const std::uint8_t* bytes, std::uint32_t count);
    /// SSTimeValue holding a copy of `time`.
    explicit VarData(const fen::AbsTime& time);

    VarData(const VarData& other) noexcept;
    VarData(VarData&& other) noexcept : type_(other.type_), payload_(other.payload_)
    {
        other.type_ = TypeCode::Empty;
        other.payload_.count = 0;
    }
    VarData& operator=(const VarData& other) noexcept;
    VarData& operator=(VarData&& other) noexcept
    {
        VarData moved(std::move(other));
        Swap(moved);
        return *this;
    }
    VarData& operator=(const char* text);
    VarData& operator=(const char16_t* text);
    ~VarData();

    /// Exchanges the two values; no reference count changes.
    void Swap(VarData& other) noexcept
    {
        std::swap(type_, other.type_);
        std::swap(payload_, other.payload_);
    }

    // Values of the simple types.
    static VarData MakeLogical(bool value) noexcept;
    static VarData MakeNumeric(double value, std::uint16_t subType = 0) noexcept;
    /// Numeric of kind 8 holding `bits` as a double.
    static VarData MakeBitField(std::uint32_t bits) noexcept;
    static VarData MakeUInt64(std::uint64_t value) noexcept;
    static VarData MakeTime(std::uint64_t count) noexcept;
    /// A value of `code` without payload (Null, CairnetBreak, LogicalPulse, ...).
    static VarData MakeTyped(std::uint32_t code) noexcept;
    /// A code-13 value holding `word`.
    static VarData MakeWord32(std::uint32_t word) noexcept;
    /// An SSTimeNumber holding a copy of `time`.
    static VarData MakeTimeNumber(const fen::AbsTime& time);
    /// AnsiString from `count` bytes; no bytes hold no storage.
    static VarData MakeAnsi(const char* text, std::uint32_t count);
    static VarData NewDictionary();
    static VarData MakeFBVariant(const std::uint16_t* descriptor, std::uint16_t descriptorWords,
                                 const std::uint8_t* data, std::uint32_t dataBytes);
    /// Replaces this value with a bit field, releasing its storage first.
    void SetBitField(std::uint32_t bits) noexcept;
    /// Replaces the sub-type (bits 16-31 of the type word); the code and the
    /// payload stay as they are.
    void SetSubType(std::uint16_t subType) noexcept { type_ = (std::uint32_t{subType} << 16) | Code(); }

    std::uint32_t TypeWord() const noexcept { return type_; }
    std::uint16_t Code() const noexcept { return static_cast<std::uint16_t>(type_ & 0xFFFF); }
    std::uint16_t SubType() const noexcept { return static_cast<std::uint16_t>(type_ >> 16); }
    /// The numeric kind of a Numeric value (bits 16-19).
    NumericKind Kind() const noexcept { return static_cast<NumericKind>((type_ >> 16) & 0xF); }
    bool HasStorage() const noexcept { return (type_ & kStorageBit) != 0; }
    /// The storage object, or null; valid while the value is unchanged.
    dynamic::IGuts* Guts() const noexcept { return HasStorage() ? payload_.guts : nullptr; }

    // Accessors that answer false when the type code does not match.
    bool GetBool(bool& value) const noexcept;
    bool GetDouble(double& value) const noexcept;
    /// Null storage gives true with (null, 0).
    bool GetRaw(const std::uint8_t*& data, std::uint32_t& count) const;
    /// Null storage gives true with the empty text.
    bool GetAnsiText(const char*& text) const;
    /// SSTimeValue only.
    bool GetTime(fen::AbsTime& time) const;
    /// The u32 of a code-13 value, the u64 of a UInt64 or Time value.
    std::uint32_t GetWord32() const noexcept { return payload_.words[0]; }
    std::uint64_t GetUInt64() const noexcept { return payload_.count; }

    // Accessors that throw TypeErrorException when the type code does not match.
    fen::String GetString() const;
    fen::WString GetWString() const;
    /// The dictionary entry under `key` for writing, inserted when absent.
    VarData& operator[](const VarData& key);
    /// The dictionary entry under `key`, or null.
    const VarData* Find(const VarData& key) const;
    DictionaryIterator Begin() const;
    DictionaryIterator End() const;

    // Vectors.
    /// A copy of element `index`; a value that is no vector gives Null.
    VarData GetElement(std::uint32_t index) const;
    /// Sets element `index`, first turning a non-vector into a vector whose
    /// element 0 is the old value.
    void SetElement(std::uint32_t index, const VarData& value);
    /// Elements, characters, bytes or entries; 0 for other types.
    std::uint32_t Size() const;

    double ToDouble() const;
    bool ToBool() const;

    /// Orders values for sorting: by type code first, then by content.
    static int Compare(const VarData& a, const VarData& b);

    /// Converts this value in place to `target` (low 16 bits); the caller
    /// makes sure the code differs from the current one. A value of the
    /// target's code is left as it is, except that a number loses its kind.
    void ConvertTo(std::uint32_t target);

private:
    union Payload {
        std::uint8_t logical;
        double number;
        std::uint64_t count;
        std::uint32_t words[2];
        dynamic::IGuts* guts;
    };

    VarData(std::uint32_t type, dynamic::IGuts* guts) noexcept : type_(type) { payload_.guts = guts; }
    void ReleaseStorage() noexcept;
    /// Copy on write: replaces shared vector or dictionary storage with a copy.
    void MakeUnshared();

    std::uint32_t type_;
    Payload payload_;
};

/// `value` limited to 0 to 4294967295 and rounded down; NaN gives the maximum.
std::uint32_t ClampToUInt32(double value) noexcept;

} // namespace qv::value
