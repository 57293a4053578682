#include "fen/osdep/UserLocalePictures.h"

#include "fen/osdep/RegKey.h"

namespace qv::fen::osdep {
namespace {

constexpr std::chrono::seconds kRereadAfter{1};

std::optional<WString> StoredText(const RegKey* key, const char16_t* name)
{
    if (key == nullptr)
        return std::nullopt;
    try {
        return key->GetStringValue(WString(name));
    } catch (const exception::Exception&) {
        return std::nullopt;
    }
}

} // namespace

UserLocalePictureSource::Pictures UserLocalePictureSource::Current() const
{
    std::lock_guard guard(lock_);
    const auto now = std::chrono::steady_clock::now();
    if (haveCache_ && now - readAt_ < kRereadAfter)
        return cached_;

    std::optional<RegKey> key;
    try {
        key.emplace(kCurrentUser, WString(u"Control Panel\\International"), true, false, u"");
    } catch (const exception::Exception&) {
        // No key: every picture comes from the POSIX locale.
    }
    const RegKey* stored = key ? &*key : nullptr;
    cached_.shortDate = StoredText(stored, u"sShortDate").value_or(posix_.ShortDatePicture());
    cached_.time = StoredText(stored, u"sTimeFormat").value_or(posix_.TimePicture());
    cached_.decimal = StoredText(stored, u"sDecimal").value_or(posix_.DecimalSeparator());
    readAt_ = now;
    haveCache_ = true;
    return cached_;
}

WString UserLocalePictureSource::ShortDatePicture() const { return Current().shortDate; }
WString UserLocalePictureSource::TimePicture() const { return Current().time; }
WString UserLocalePictureSource::DecimalSeparator() const { return Current().decimal; }

} // namespace qv::fen::osdep
