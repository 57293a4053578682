#include "support/FixedHostName.h"

#include "client/OCException.h"
#include "client/SubscriptionURL.h"
#include "fen/OrvekURL.h"

#include <gtest/gtest.h>

namespace qv::test {
namespace {

using fbfen::orvekclient::SubscriptionText;

// Compared as exact text: WString's own comparison ignores case.
std::u16string Subscribed(const char16_t* text)
{
    return SubscriptionText(fen::OrvekURL(text)).c_str();
}

TEST(SubscriptionURL, NamesThisMachineForLocalhostAndTheLocalForm)
{
    FixedHostName name("plant7");
    EXPECT_EQ(Subscribed(u"\\\\localhost\\boiler\\drum.level"), u"\\\\plant7\\boiler\\drum.level");
    EXPECT_EQ(Subscribed(u"\\\\LocalHOST\\boiler\\drum.level"), u"\\\\plant7\\boiler\\drum.level");
    EXPECT_EQ(Subscribed(u"\\\\.\\boiler\\drum.level"), u"\\\\plant7\\boiler\\drum.level");
    EXPECT_EQ(Subscribed(u"\\\\.\\boiler"), u"\\\\plant7\\boiler");
    // Other hosts, and names that merely contain "localhost", stay.
    EXPECT_EQ(Subscribed(u"\\\\localhost2\\p\\a"), u"\\\\localhost2\\p\\a");
    EXPECT_EQ(Subscribed(u"\\\\other\\p\\'a.b'"), u"\\\\other\\p\\'a.b'");
}

TEST(SubscriptionURL, RefusesRootAndRelativeForms)
{
    for (const char16_t* text : {u"\\boiler\\drum", u"drum.level", u""}) {
        try {
            Subscribed(text);
            ADD_FAILURE() << "accepted a URL without a host";
        } catch (const fbfen::orvekclient::OCException& e) {
            EXPECT_EQ(e.GetStatus(), fbfen::orvekclient::kStatusInvalidArgument);
        }
    }
}

} // namespace
} // namespace qv::test
