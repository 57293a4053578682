#include "fen/osdep/RegKey.h"
#include "fen/osdep/UserLocalePictures.h"
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
    const UserLocalePictureSource user;
    EXPECT_EQ(user.ShortDatePicture().View(), u"dd.MM.yyyy");
    EXPECT_EQ(user.DecimalSeparator().View(), u",");
    EXPECT_EQ(user.TimePicture().View(), posix.TimePicture().View()); // not stored: the locale's
}
