#pragma once
/// \file
/// The user's own date and time pictures, kept in the registry store.

#include "fen/osdep/LocalePicture.h"

#include <chrono>
#include <mutex>

namespace qv::fen::osdep {

/// Pictures from the values sShortDate, sTimeFormat and sDecimal of the
/// current user's key "Control Panel\International"; each value that is
/// absent (or not text) comes from the POSIX locale instead. The store is
/// read at most once a second, since every time text asks for the pictures;
/// a change made by hand shows within that second.
class UserLocalePictureSource : public LocalePictureSource {
public:
    WString ShortDatePicture() const override;
    WString TimePicture() const override;
    WString DecimalSeparator() const override;

private:
    struct Pictures {
        WString shortDate;
        WString time;
        WString decimal;
    };
    Pictures Current() const;

    PosixLocalePictureSource posix_;
    mutable std::mutex lock_;
    mutable Pictures cached_;
    mutable std::chrono::steady_clock::time_point readAt_{};
    mutable bool haveCache_ = false;
};

} // namespace qv::fen::osdep
