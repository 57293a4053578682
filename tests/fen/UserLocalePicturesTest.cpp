#include "fen/osdep/RegKey.h"
#include "fen/osdep/TimeText.h"
#include "fen/osdep/UserLocalePictures.h"
#include "ScopedPictureSource.h"
#include "support/TemporaryHome.h"

#include <gtest/gtest.h>

using namespace qv::fen;
using namespace qv::fen::osdep;

TEST(UserLocalePictures, StoredPicturesTakePrecedenceOverThePosixLocale)
{
    qv::test::TemporaryHome home;
    const PosixLocalePictureSource posix;
    {
        UserLocalePictureSource nothingStored;
        EXPECT_EQ(nothingStored.ShortDatePicture().View(), posix.ShortDatePicture().View());
        EXPECT_EQ(nothingStored.DecimalSeparator().View(), posix.DecimalSeparator().View());
    }

    RegKey international(kCurrentUser, WString(u"Control Panel\\International"), false, true, u"");
    international.SetStringValue(WString(u"sShortDate"), WString(u"dd.MM.yyyy"));
    international.SetStringValue(WString(u"sDecimal"), WString(u","));
    auto user = std::make_shared<UserLocalePictureSource>();
    EXPECT_EQ(user->ShortDatePicture().View(), u"dd.MM.yyyy");
    EXPECT_EQ(user->TimePicture().View(), posix.TimePicture().View()); // not stored: the locale's

    // The time text follows the stored pictures.
    qv::test::ScopedPictureSource scope(user);
    const AbsTime time = AbsTimeFromUnixSeconds(1'700'000'000, 0x8000000000000000u); // 2023-11-14 22:13:20.5 UTC
    const WString text = AbsTimeToString(time, nullptr, u"%H:%M:%S", 1, kShowUtc, false, nullptr, kLocaleSeparator);
    EXPECT_EQ(text.View(), u"14.11.2023 22:13:20,5");
}
