#include "value/StringCache.h"

#include <gtest/gtest.h>

#include <map>
#include <string>
#include <vector>

using namespace qv::value;

namespace {

// A module with texts of any length that records the buffer sizes it is given.
class FakeModule : public StringModule {
public:
    std::size_t LoadString(std::uint32_t id, char* buffer, std::size_t size) const override
    {
        sizes.push_back(size);
        auto found = texts.find(id);
        if (found == texts.end())
            return CopyTruncated("", 0, buffer, size);
        return CopyTruncated(found->second.data(), found->second.size(), buffer, size);
    }

    std::map<std::uint32_t, std::string> texts;
    mutable std::vector<std::size_t> sizes;
};

} // namespace

TEST(StringCache, LoadsOnceFromTheStringTable)
{
    ResourceStringModule module;
    StringCache cache(module);
    const qv::fen::String& first = cache.Get(61290);
    EXPECT_EQ(first.View(), "Undefined");
    EXPECT_EQ(cache.Get(203).View(), "QV Network Real Time Point");
    EXPECT_EQ(&first, &cache.Get(61290)); // still valid after another insertion
    EXPECT_EQ(cache.Size(), 2u);
}

TEST(StringCache, AbsentStringIsEmptyAndNeverCached)
{
    FakeModule module;
    StringCache cache(module);
    const qv::fen::String& first = cache.Get(42);
    EXPECT_TRUE(first.empty());
    EXPECT_TRUE(cache.Get(42).empty());
    EXPECT_EQ(&cache.Get(7), &first); // one shared empty text
    EXPECT_EQ(cache.Size(), 0u);
    EXPECT_EQ(module.sizes.size(), 3u); // looked up on every call
}

TEST(StringCache, GrowsTheBufferWhileTheTextFillsIt)
{
    FakeModule module;
    module.texts = {{1, std::string(254, 'a')}, {2, std::string(255, 'b')}, {3, std::string(511, 'c')}};
    StringCache cache(module);
    const struct {
        std::uint32_t id;
        std::vector<std::size_t> sizes;
    } cases[] = {
        {1, {256}},
        {2, {256, 512}},
        {3, {256, 512, 768}},
    };
    for (const auto& c : cases) {
        module.sizes.clear();
        EXPECT_EQ(std::string(cache.Get(c.id).View()), module.texts[c.id]) << c.id;
        EXPECT_EQ(module.sizes, c.sizes) << c.id;
        module.sizes.clear();
        cache.Get(c.id);
        EXPECT_TRUE(module.sizes.empty()) << c.id;
    }
}

TEST(StringModule, LoadTruncatesAndTerminates)
{
    ResourceStringModule module;
    char buffer[8] = "xxxxxxx";
    EXPECT_EQ(module.LoadString(61290, buffer, 4), 3u);
    EXPECT_STREQ(buffer, "Und");
    EXPECT_EQ(module.LoadString(497, buffer, sizeof buffer), 4u);
    EXPECT_STREQ(buffer, "NULL");
    EXPECT_EQ(module.LoadString(1, buffer, sizeof buffer), 0u);
    EXPECT_STREQ(buffer, "");
    EXPECT_EQ(module.LoadString(497, buffer, 0), 0u);
    EXPECT_EQ(module.LoadString(497, nullptr, 8), 0u);
}
