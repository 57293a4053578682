#pragma once
/// \file
/// The storage objects ("guts") behind values that hold text, bytes,
/// vectors, dictionaries, times, foreign variants and flex data.
///
/// Every object is reference-counted: a creator returns it holding one
/// reference, AddRef adds one, Release drops one, returns the number left and
/// destroys the object at zero. Counts are atomic, so values that share an
/// object may live on different threads; the object's contents are not
/// synchronised, which is why writers first make the storage unshared.
///
/// The operations of each interface are declared in their fixed slot order:
/// 0 QueryInterface, 1 AddRef, 2 Release, 3 to logical, 4 to double,
/// 5 compare, then the kind's own slots (noted on each).

#include "value/dynamic/Guid.h"

#include <cstdint>

namespace qv::fen {
struct AbsTime;
}

namespace qv::value {
class VarData;
}

namespace qv::value::dynamic {

/// Slots 0-5, common to every storage object.
class IGuts {
public:
    /// Slot 0: `out` receives the interface `iid` with a reference added;
    /// negative (kNoInterface) when the object does not offer it.
    virtual std::int32_t QueryInterface(const Guid& iid, void** out) = 0;
    /// Slot 1.
    virtual std::uint32_t AddRef() = 0;
    /// Slot 2: the number of references left.
    virtual std::uint32_t Release() = 0;
    /// Slot 3.
    virtual bool ToBool() const = 0;
    /// Slot 4.
    virtual double ToDouble() const = 0;
    /// Slot 5: negative, 0 or positive; `other` is an object of the same type code.
    virtual int Compare(const IGuts* other) const = 0;

protected:
    ~IGuts() = default;
};

/// 8-bit text (code 0x1005).
class IAnsiTextGuts : public IGuts {
public:
    /// Slot 6: the NUL-terminated characters.
    virtual const char* Chars() const = 0;
    /// Slot 7: the number of characters.
    virtual std::uint32_t Length() const = 0;

protected:
    ~IAnsiTextGuts() = default;
};

/// UTF-16 text (code 0x1006).
class IUnicodeTextGuts : public IGuts {
public:
    /// Slot 6: the NUL-terminated code units.
    virtual const char16_t* Chars() const = 0;
    /// Slot 7: the number of code units.
    virtual std::uint32_t Length() const = 0;

protected:
    ~IUnicodeTextGuts() = default;
};

/// Ordered elements (code 0x3007).
class IVectorGuts : public IGuts {
public:
    /// Slot 7: sets element `index`; the vector grows with empty values to reach it.
    virtual void SetElement(std::uint32_t index, VarData value) = 0;
    /// Slot 8: the number of elements.
    virtual std::uint32_t Count() const = 0;
    /// Slot 9: an unshared copy holding one reference.
    virtual IVectorGuts* Copy() const = 0;

protected:
    ~IVectorGuts() = default;
};

/// An iterator over a dictionary; owned by one holder, destroyed through slot 0.
class IDictionaryIterator {
public:
    /// Slot 0.
    virtual void Destroy() = 0;
    /// Slot 2.
    virtual const VarData* Value() const = 0;
    /// Slot 3.
    virtual const VarData* Key() const = 0;
    /// Slot 5.
    virtual void Advance() = 0;
    /// Slot 7.
    virtual bool Equals(const IDictionaryIterator* other) const = 0;
    /// Slot 8: a new iterator at the same entry.
    virtual IDictionaryIterator* Copy() const = 0;

protected:
    ~IDictionaryIterator() = default;
};

/// A map from keys to values, ordered by key (code 0x100C).
class IDictionaryGuts : public IGuts {
public:
    /// Slot 7: the value under `key`, or null.
    virtual const VarData* Find(const VarData& key) const = 0;
    /// Slot 8: the value under `key` for writing, inserted empty when absent.
    virtual VarData* Element(const VarData& key) = 0;
    /// Slot 9: an iterator at the first entry; it keeps the storage alive.
    virtual IDictionaryIterator* Begin(const VarData& owner) const = 0;
    /// Slot 10: an iterator past the last entry.
    virtual IDictionaryIterator* End(const VarData& owner) const = 0;
    /// Slot 14: an unshared copy holding one reference.
    virtual IDictionaryGuts* Copy() const = 0;
    /// Slot 15: the dictionary as text, "{key: value, ...}", in a buffer that
    /// the caller frees with wfd_free; null when there is no text.
    virtual char16_t* NewText() const = 0;
    /// Slot 16: the number of entries.
    virtual std::uint32_t Count() const = 0;

protected:
    ~IDictionaryGuts() = default;
};

/// One absolute time (codes 0x100F and 0x1010).
class ITimeGuts : public IGuts {
public:
    /// Slot 6: writes the time into `out` and returns `out`.
    virtual fen::AbsTime* GetTime(fen::AbsTime* out) const = 0;

protected:
    ~ITimeGuts() = default;
};

/// A foreign variant: type descriptor words and flattened data (code 0x1012).
class IFBVariantGuts : public IGuts {
public:
    /// Slot 6: the descriptor and its word count, the data and its byte count.
    virtual void GetContents(const std::uint16_t** descriptor, std::uint16_t* descriptorWords,
                             const std::uint8_t** data, std::uint32_t* dataBytes) const = 0;

protected:
    ~IFBVariantGuts() = default;
};

/// Interface kIID_VectorElements.
class IVectorElements : public IGuts {
public:
    /// Slot 6: a copy of element `index`; past the end gives an empty value.
    virtual void GetElement(VarData* out, std::uint32_t index) const = 0;

protected:
    ~IVectorElements() = default;
};

/// Interface kIID_AnsiChars.
class IAnsiChars : public IGuts {
public:
    /// Slot 6.
    virtual const char* GetChars() const = 0;

protected:
    ~IAnsiChars() = default;
};

/// Interface kIID_RawBytes.
class IRawBytes : public IGuts {
public:
    /// Slot 6: the bytes and their count; true on success.
    virtual bool GetBytes(const std::uint8_t** data, std::uint32_t* count) const = 0;

protected:
    ~IRawBytes() = default;
};

/// Interface kIID_FlexData.
class IFlexData : public IGuts {
public:
    /// Slot 11: the wrapped value; `success` says whether there is one.
    virtual void Unwrap(VarData* out, bool* success) const = 0;

protected:
    ~IFlexData() = default;
};

} // namespace qv::value::dynamic
