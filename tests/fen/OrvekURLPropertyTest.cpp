// Properties over many generated URL texts: only SyntaxError ever comes out
// of the parser, every accepted text reads back the same after printing, and
// the grammar and the tokenizer agree.

#include "fen/OrvekURL.h"
#include "fen/OrvekURLGrammar.h"
#include "fen/SyntaxError.h"
#include "OrvekURLTestSupport.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <memory>
#include <random>
#include <string>

using namespace qv::fen;
using qv::fen::exception::SyntaxError;
using qv::fen::test::Describe;
using qv::fen::test::Printable;
using qv::fen::test::SameUrl;

namespace {

// Characters that matter to the grammar, weighted towards them, plus a few
// ordinary and unusual ones.
const char16_t kAlphabet[] = {u'\\', u'\\', u'\\', u'.', u'.', u'.', u'\'', u'\'', u'a', u'h', u'/',
                              u' ',  u'\t', u'\r', u'\n', 0x00DF, 0xD800, 0xFFFF};

class UrlTextGenerator {
public:
    explicit UrlTextGenerator(std::uint32_t seed) : random_(seed) {}

    /// Mostly well-formed texts built piece by piece, so that many are accepted.
    std::u16string Structured()
    {
        static const char16_t* const kPrefixes[] = {u"", u"\\", u"\\\\h\\", u"\\\\a.b.\\", u"\\\\.\\",
                                                    u"..\\", u"\\..\\", u"\\\\"};
        static const char16_t* const kNames[] = {u"a", u"Var", u"x y", u"a/b", u"\u00DF", u"\xD800", u"\t",
                                                 u"'q.r'", u"'it''s'", u"'a\\b'", u"'\r\n'", u"'..'"};
        std::u16string text = kPrefixes[Below(std::size(kPrefixes))];
        for (std::size_t i = 0, n = Below(5); i < n; ++i) {
            if (i != 0)
                text += Below(3) == 0 ? u'.' : u'\\';
            text += kNames[Below(std::size(kNames))];
        }
        if (Below(6) == 0)
            text += Below(2) == 0 ? u'.' : u'\\';
        return text;
    }

    /// `text` with a few characters inserted, removed or replaced.
    std::u16string Mutated(std::u16string text)
    {
        for (std::size_t i = 0, n = 1 + Below(4); i < n; ++i) {
            const char16_t c = kAlphabet[Below(std::size(kAlphabet))];
            const std::size_t at = Below(text.size() + 1);
            if (at == text.size() || Below(3) == 0)
                text.insert(at, 1, c);
            else if (Below(2) == 0)
                text.erase(at, 1);
            else
                text[at] = c;
        }
        return text;
    }

private:
    std::size_t Below(std::size_t n) { return std::uniform_int_distribution<std::size_t>(0, n - 1)(random_); }

    std::mt19937 random_;
};

/// Parses `text` from a buffer of exactly its size, so that a read past the
/// NUL lands outside the allocation. Returns false when the text is rejected.
bool TryParse(const std::u16string& text, std::unique_ptr<OrvekURL>& url)
{
    auto buffer = std::make_unique<char16_t[]>(text.size() + 1);
    std::char_traits<char16_t>::copy(buffer.get(), text.data(), text.size());
    buffer[text.size()] = 0;
    try {
        url = std::make_unique<OrvekURL>(buffer.get());
        return true;
    } catch (const SyntaxError&) {
        return false;
    } catch (const std::exception& e) {
        ADD_FAILURE() << Printable(text) << " threw " << e.what();
        return false;
    }
}

/// Checks one text; returns whether it was accepted.
bool CheckOne(const std::u16string& text)
{
    std::unique_ptr<OrvekURL> url;
    const bool accepted = TryParse(text, url);

    const auto verdict = detail::CheckUrlGrammar(detail::UrlText(text));
    if (!accepted) {
        // The grammar only lets through what then fails as an empty quoted name.
        if (detail::IsAccepted(verdict) && text.find(u"''") == std::u16string::npos)
            ADD_FAILURE() << "grammar accepts but parse fails: " << Printable(text);
        return false;
    }
    EXPECT_TRUE(detail::IsAccepted(verdict)) << Printable(text);

    const WString printed = url->ToString();
    std::unique_ptr<OrvekURL> again;
    if (!TryParse(std::u16string(printed.View()), again)) {
        ADD_FAILURE() << Printable(text) << " prints as unreadable " << Printable(printed.View());
        return true;
    }
    EXPECT_TRUE(SameUrl(*url, *again)) << Printable(text) << ": " << Describe(*url) << " printed as "
                                       << Printable(printed.View()) << " reads back as " << Describe(*again);
    EXPECT_EQ(again->ToString().View(), printed.View()) << Printable(text);
    return true;
}

TEST(OrvekURLProperty, GeneratedTextsReadBackAfterPrintingAndOnlyEverFailWithSyntaxError)
{
    UrlTextGenerator structured(20240611);
    std::size_t accepted = 0;
    constexpr std::size_t kCount = 20000;
    for (std::size_t i = 0; i < kCount && !HasFailure(); ++i)
        accepted += CheckOne(structured.Structured()) ? 1 : 0;
    // The generator is meant to reach deep into the grammar, not stop at the door.
    EXPECT_TRUE(HasFailure() || accepted > kCount / 3) << accepted << " accepted";

    UrlTextGenerator mutated(7);
    for (std::size_t i = 0; i < 10 * kCount && !HasFailure(); ++i)
        CheckOne(mutated.Mutated(i % 4 == 0 ? std::u16string() : mutated.Structured()));
}

} // namespace
