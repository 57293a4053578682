#pragma once
/// \file
/// The user's date and time pictures ("M/d/yyyy", "h:mm:ss tt") and their
/// translation into wcsftime formats.
///
/// A picture names each field by a run of one letter (d, M, y, h, H, m, s, t)
/// and copies text between apostrophes literally. Where the pictures come
/// from is one replaceable object, a LocalePictureSource: by default the
/// user's own pictures in the registry store, and for those not set there
/// the POSIX locale of the process (its LC_TIME and LC_NUMERIC categories).

#include "fen/String.h"

#include <memory>
#include <string_view>

namespace qv::fen::osdep {

/// Supplies the user's pictures and decimal separator.
///
/// Implementations must be safe to call from any thread; AbsTimeToString
/// asks the current source on every call that needs a locale value.
class LocalePictureSource {
public:
    virtual ~LocalePictureSource() = default;
    /// The short date picture, for example "M/d/yyyy".
    virtual WString ShortDatePicture() const = 0;
    /// The time-of-day picture, for example "h:mm:ss tt".
    virtual WString TimePicture() const = 0;
    /// The text that separates whole seconds from their fraction.
    virtual WString DecimalSeparator() const = 0;
};

/// Pictures derived from the process's POSIX locale: nl_langinfo's D_FMT and
/// T_FMT turned into pictures, and RADIXCHAR.
class PosixLocalePictureSource : public LocalePictureSource {
public:
    WString ShortDatePicture() const override;
    WString TimePicture() const override;
    WString DecimalSeparator() const override;
};

/// The source in use.
std::shared_ptr<const LocalePictureSource> GetLocalePictureSource();

/// Makes `source` the source in use (null restores the default source) and
/// returns the one it replaces.
std::shared_ptr<const LocalePictureSource> SetLocalePictureSource(
    std::shared_ptr<const LocalePictureSource> source);

/// The wcsftime format of a picture.
///
/// Runs of a letter translate as a whole: d dd ddd dddd to %#d %d %a %A;
/// M MM MMM MMMM to %#m %m %b %B; y yy yyyy to %#y %y %Y; h hh to %#I %I;
/// H HH to %#H %H; m mm to %#M %M; s ss to %#S %S; t tt to %p. Longer runs
/// (and yyy) give nothing, as does each g. Text between apostrophes is copied
/// without them (an unclosed one runs to the end). A percent sign becomes
/// "%%" so that it shows as itself; every other character is copied.
WString PictureToTimeFormat(std::u16string_view picture);

/// The picture of a strftime format such as nl_langinfo returns ("%m/%d/%y"
/// gives "MM/dd/yy").
///
/// Composite conversions are expanded (%D, %F, %T, %R, and %r through
/// `twelveHourFormat`, the locale's T_FMT_AMPM); glibc's flags, widths and
/// the E and O modifiers are dropped, except that '-' picks the unpadded
/// field; conversions without a picture field (%Z, %j, ...) give nothing.
/// Letters of literal text are quoted with apostrophes; a literal apostrophe,
/// which a picture cannot hold, is dropped.
WString PictureFromStrftimeFormat(std::u16string_view format, std::u16string_view twelveHourFormat = u"%I:%M:%S %p");

/// The user's short date format as a wcsftime format.
WString GetSystemDateFormat();
/// The user's time-of-day format as a wcsftime format.
WString GetSystemTimeFormat();
/// The user's decimal separator.
WString GetSystemDecimalSeparator();

} // namespace qv::fen::osdep
