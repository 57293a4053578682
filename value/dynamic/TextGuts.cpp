// Storage of 8-bit and UTF-16 text. Texts compare by code unit, then by
// length, so the order is total and the same on every host.

#include "value/dynamic/DynamicData.h"
#include "value/dynamic/RefCounted.h"
#include "value/dynamic/TextReading.h"

#include <string>

namespace qv::value::dynamic {
namespace {

class AnsiGuts final : public RefCounted<IAnsiTextGuts>, public IAnsiChars {
public:
    AnsiGuts(const char* text, std::uint32_t length) : text_(text, length) {}

    std::uint32_t AddRef() override { return RefCounted::AddRef(); }
    std::uint32_t Release() override { return RefCounted::Release(); }
    std::int32_t QueryInterface(const Guid& iid, void** out) override
    {
        if (iid == kIID_AnsiChars)
            return Offer(static_cast<IAnsiChars*>(this), out);
        return RefCounted::QueryInterface(iid, out);
    }
    bool ToBool() const override { return TextToBool(text_); }
    double ToDouble() const override { return TextToDouble(text_); }
    int Compare(const IGuts* other) const override
    {
        const auto* that = static_cast<const IAnsiTextGuts*>(other);
        return std::string_view(text_).compare(std::string_view(that->Chars(), that->Length()));
    }
    const char* Chars() const override { return text_.c_str(); }
    std::uint32_t Length() const override { return static_cast<std::uint32_t>(text_.size()); }
    const char* GetChars() const override { return text_.c_str(); }

private:
    std::string text_;
};

class UnicodeGuts final : public RefCounted<IUnicodeTextGuts> {
public:
    UnicodeGuts(const char16_t* text, std::uint32_t length) : text_(text, length) {}

    bool ToBool() const override { return TextToBool(text_); }
    double ToDouble() const override { return TextToDouble(text_); }
    int Compare(const IGuts* other) const override
    {
        const auto* that = static_cast<const IUnicodeTextGuts*>(other);
        return std::u16string_view(text_).compare(std::u16string_view(that->Chars(), that->Length()));
    }
    const char16_t* Chars() const override { return text_.c_str(); }
    std::uint32_t Length() const override { return static_cast<std::uint32_t>(text_.size()); }

private:
    std::u16string text_;
};

} // namespace

IAnsiTextGuts* NewAnsiGuts(const char* text)
{
    return NewAnsiGutsLen(text, static_cast<std::uint32_t>(std::char_traits<char>::length(text)));
}

IAnsiTextGuts* NewAnsiGutsLen(const char* text, std::uint32_t bytes)
{
    return new AnsiGuts(text, bytes);
}

IUnicodeTextGuts* NewUnicodeGuts(const char16_t* text)
{
    return NewUnicodeGutsLen(text, static_cast<std::uint32_t>(std::char_traits<char16_t>::length(text)));
}

IUnicodeTextGuts* NewUnicodeGutsLen(const char16_t* text, std::uint32_t codeUnits)
{
    return new UnicodeGuts(text, codeUnits);
}

} // namespace qv::value::dynamic
