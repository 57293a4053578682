#include "document/DropDecoding.h"

#include <gtest/gtest.h>

using namespace std::string_literals;
using namespace qv::document;

namespace {

const DropRecord kThree[] = {
    {3, 5, kDropVariableKind, u"\\\\h\\p\\a"},
    {1, 4, 4, u"\\\\h\\p"},
    {1, 8, kDropVariableKind, u"\\\\h\\p\\caf\u00E9"},
};

} // namespace

TEST(DocumentDropDecoding, TakesOnlyVariableRecordsInBlockOrder)
{
    const std::string block = EncodeDropBlock(kThree);
    // Count, then the first record's fixed fields and URL length.
    EXPECT_EQ(block.substr(0, 16), "\x03\0\0\0\x03\0\x05\0\x05\0\0\0\x07\0\0\0"s);

    const ItemBatch batch = DecodeDropBlock(block);
    ASSERT_EQ(batch.size(), 2u);
    EXPECT_EQ(batch[0].url, "\\\\h\\p\\a");
    EXPECT_EQ(batch[0].access, 3);
    EXPECT_EQ(batch[0].dataType, 5);
    EXPECT_EQ(batch[1].url, "\\\\h\\p\\caf\xC3\xA9");
    EXPECT_EQ(batch[1].access, 1);
    EXPECT_EQ(batch[1].dataType, 8);

    EXPECT_TRUE(DecodeDropBlock(EncodeDropBlock({})).empty());
}

TEST(DocumentDropDecoding, MalformedBlocksGiveAnEmptyBatch)
{
    const std::string block = EncodeDropBlock(kThree);
    for (std::size_t n = 0; n < block.size(); ++n)
        EXPECT_TRUE(DecodeDropBlock(block.substr(0, n)).empty()) << n << " bytes";
    EXPECT_TRUE(DecodeDropBlock(block + "\0"s).empty());

    // A huge record count, and a huge URL length, over a few bytes.
    EXPECT_TRUE(DecodeDropBlock("\xFF\xFF\xFF\xFF"s + block.substr(4)).empty());
    EXPECT_TRUE(DecodeDropBlock("\x01\0\0\0\x01\0\x01\0\x05\0\0\0\xFF\xFF\xFF\x7F" "a\0"s).empty());
}
