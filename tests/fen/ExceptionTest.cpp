#include "fen/Exception.h"
#include "fen/SyntaxError.h"
#include "fen/TypeErrors.h"
#include "fen/osdep/ErrnoMapping.h"
#include "fen/osdep/OSException.h"

#include <cerrno>
#include <cstring>
#include <gtest/gtest.h>
#include <memory>
#include <new>

using namespace qv::fen;
using namespace qv::fen::exception;
using qv::fen::osdep::OSException;
using qv::fen::osdep::WinError;

namespace {

[[noreturn]] void ThrowOutOfRange() { QV_THROW(OutOfRange()); }
[[noreturn]] void ThrowInvalidArgument() { QV_THROW(InvalidArgument()); }

template <typename E>
void ExpectTextAndCode(const char* text, std::uint32_t code)
{
    E e;
    EXPECT_STREQ(e.what(), text);
    EXPECT_EQ(static_cast<std::uint32_t>(e.GetErrorCode()), code);
}

} // namespace

TEST(Exception, ClassesCarryTheirFixedTextsAndCodes)
{
    ExpectTextAndCode<Exception>("unspecified exception", 0xFFFFFFFFu);
    ExpectTextAndCode<InvalidLocale>("Invalid locale", 0x8ABC7024u);
    ExpectTextAndCode<OutOfRange>("Out of range", 0x8ABC7007u);
    ExpectTextAndCode<InvalidArgument>("Invalid argument(s)", 0x8ABC700Fu);
    ExpectTextAndCode<InvalidOperation>("Invalid operation", 0x8ABC700Eu);
    ExpectTextAndCode<BufferOverflow>("Buffer overflowed", 0x8ABC7017u);
    ExpectTextAndCode<BadGuidString>("Badly formatted Guid string.", 0x8ABC7032u);
    ExpectTextAndCode<ServiceFailure>("Unable to start service", 0x8ABC7006u);
    ExpectTextAndCode<UnableToConvert>("Unable to convert.", 0x8ABC7034u);
    EXPECT_EQ(SyntaxError().GetErrorCode(), -1967362044);
    EXPECT_STREQ(TypeErrorException().what(), "VarData type error");
}

TEST(Exception, LocationIsStampedAtTheThrowSiteAndSharedByAddress)
{
    EXPECT_EQ(Exception().GetLine(), 0);
    EXPECT_EQ(Exception().GetFile(), nullptr);

    const char* firstFile = nullptr;
    try {
        ThrowOutOfRange();
    } catch (const Exception& e) {
        EXPECT_GT(e.GetLine(), 0);
        ASSERT_NE(e.GetFile(), nullptr);
        EXPECT_NE(std::strstr(e.GetFile(), "ExceptionTest.cpp"), nullptr);
        firstFile = e.GetFile();
    }
    try {
        ThrowInvalidArgument();
    } catch (const Exception& e) {
        EXPECT_EQ(e.GetFile(), firstFile); // one static text per source file
    }
}

TEST(Exception, TreeIsCaughtByItsBases)
{
    auto caughtAsException = [](auto thrower) {
        try {
            thrower();
        } catch (const Exception&) {
            return true;
        } catch (...) {
            return false;
        }
        return false;
    };
    EXPECT_TRUE(caughtAsException([] { QV_THROW(UnableToConvert()); }));
    EXPECT_TRUE(caughtAsException([] { QV_THROW(WinError(5u)); }));
    EXPECT_TRUE(caughtAsException([] { QV_THROW(SyntaxError()); }));
    EXPECT_FALSE(caughtAsException([] { throw TypeErrorException(); }));
    EXPECT_FALSE(caughtAsException([] { throw std::bad_alloc(); }));
}

TEST(Exception, WinErrorStatusTable)
{
    struct Row {
        std::uint32_t osError;
        std::int32_t status;
    };
    const Row rows[] = {{0, 0},    {2, 7},      {3, 7},   {15, 7},  {4, 11},  {5, static_cast<std::int32_t>(0x80070005u)},
                        {6, 1},    {87, 1},     {8, 2},   {14, 2},  {11, 23}, {16, 8},
                        {19, 8},   {32, 8},     {33, 8},  {20, 37}, {23, -508}, {38, 4},
                        {39, 9},   {80, -98},   {1000, 42}, {1, 42}};
    for (const Row& row : rows)
        EXPECT_EQ(WinError(row.osError).GetErrorCode(), row.status) << "osError " << row.osError;
    EXPECT_EQ(OSException().GetErrorCode(), 42);
}

TEST(Exception, WinErrorTextComesFromTheSystemOrStaysUnknownAndDefaultsToErrno)
{
    EXPECT_STREQ(WinError(2u).what(), std::strerror(ENOENT));
    EXPECT_STREQ(WinError(1000u).what(), "Unknown error");
    EXPECT_STREQ(OSException().what(), "Unknown error");
    EXPECT_EQ(OSException().GetOSErrorCode(), 0u);

    errno = EACCES;
    WinError denied;
    EXPECT_EQ(denied.GetOSErrorCode(), 5u);
    EXPECT_STREQ(denied.what(), std::strerror(EACCES));

    // An errno without a Win32 equivalent keeps its own text.
    errno = EDOM;
    WinError unmapped;
    EXPECT_EQ(unmapped.GetOSErrorCode(), osdep::kGenericWin32Error);
    EXPECT_STREQ(unmapped.what(), std::strerror(EDOM));
}

TEST(Exception, SyntaxErrorMessage)
{
    EXPECT_STREQ(SyntaxError().what(), "SyntaxError");
    EXPECT_STREQ(SyntaxError(WString(u"\\\\h\\p.x")).what(), "SyntaxError: \\\\h\\p.x");
    EXPECT_STREQ(SyntaxError(WString(u"caf\u00E9")).what(), "SyntaxError: caf\xC3\xA9");
    // A lone surrogate cannot be represented; it must not turn the syntax
    // error into another failure.
    const char16_t lone[] = {u'a', 0xD800, u'b', 0};
    EXPECT_STREQ(SyntaxError(WString(lone)).what(), "SyntaxError: a?b");
}

TEST(Exception, CopiesOwnTheirMessages)
{
    auto original = std::make_unique<SyntaxError>(WString(u"abc"));
    SyntaxError copy(*original);
    auto os = std::make_unique<WinError>(String("disk on fire"), 5u);
    OSException osCopy(*os);
    original.reset();
    os.reset();
    EXPECT_STREQ(copy.what(), "SyntaxError: abc");
    EXPECT_STREQ(osCopy.what(), "disk on fire");
    EXPECT_EQ(osCopy.GetOSErrorCode(), 5u);
}
