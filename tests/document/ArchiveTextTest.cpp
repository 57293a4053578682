#include "document/ArchiveText.h"

#include <gtest/gtest.h>

using namespace std::string_literals;
using namespace qv::document;

TEST(DocumentArchiveText, WritesTheShortestLengthFormAndReadsItBack)
{
    const std::pair<std::size_t, std::string> rows[] = {
        {0, "\x00"s}, {254, "\xFE"s}, {255, "\xFF\xFF\x00"s}, {0xFFFD, "\xFF\xFD\xFF"s},
        {0xFFFE, "\xFF\xFF\xFF\xFE\xFF\x00\x00"s},
    };
    for (const auto& [length, prefix] : rows) {
        std::string field;
        AppendTextField(field, std::string(length, 'q'));
        EXPECT_EQ(field, prefix + std::string(length, 'q')) << length;
        ArchiveReader reader(field);
        EXPECT_EQ(reader.ReadText(), std::string(length, 'q'));
        EXPECT_TRUE(reader.AtEnd());
    }
}

TEST(DocumentArchiveText, ReadsWideFieldsInEveryLengthForm)
{
    // 0xFF, the marker 0xFFFE, then the length: one byte, 0xFF + 16 bits,
    // or 0xFF + 0xFFFF + 32 bits; e-acute becomes UTF-8 in this locale.
    const std::string units = "a\0\xE9\0z\0"s;
    const std::string bytes = "\xFF\xFE\xFF\x03"s + units + "\xFF\xFE\xFF\xFF\x03\x00"s + units +
                              "\xFF\xFE\xFF\xFF\xFF\xFF\x03\x00\x00\x00"s + units + "\xFF\xFE\xFF\x00"s;
    ArchiveReader reader(bytes);
    for (int i = 0; i < 3; ++i)
        EXPECT_EQ(reader.ReadText(), "a\xC3\xA9z");
    EXPECT_EQ(reader.ReadText(), "");
    EXPECT_TRUE(reader.AtEnd());
}

TEST(DocumentArchiveText, NumbersAreSignedDecimalTextReadLikeTheStandardConversion)
{
    std::string written;
    AppendNumberField(written, -1);
    AppendNumberField(written, 44);
    EXPECT_EQ(written, "\x02-1\x02" "44"s);

    const std::pair<const char*, std::int32_t> rows[] = {
        {"  \t12", 12}, {"-7", -7}, {"+5", 5}, {"42abc", 42}, {"abc", 0}, {"", 0}, {"- 3", 0},
        {"99999999999999999999", 2147483647}, {"-2147483649", -2147483647 - 1},
    };
    for (const auto& [text, value] : rows) {
        std::string field;
        AppendTextField(field, text);
        EXPECT_EQ(ArchiveReader(field).ReadNumber(), value) << '"' << text << '"';
    }
    EXPECT_EQ(ArchiveReader("\xFF\xFE\xFF\x03 \0-\0" "9\0"s).ReadNumber(), -9);
}

TEST(DocumentArchiveText, DataThatEndsEarlyOrClaimsTooMuchThrowsWithoutAllocating)
{
    const std::string cases[] = {
        ""s,
        "\x05" "abc"s,
        "\xFF\x01"s,
        "\xFF\xFF\xFF\xFF\xFF\xFF\x7F" "abc"s,                 // 2 GiB announced
        "\xFF\xFE\xFF\xFF\xFF\xFF\xFE\xFF\xFF\xFF" "ab"s,      // 8 GiB of wide text announced
        "\xFF\xFE\xFF\x02" "a\0b"s,                            // half a wide character missing
    };
    for (const std::string& bytes : cases) {
        try {
            ArchiveReader(bytes).ReadText();
            ADD_FAILURE() << "no error for " << testing::PrintToString(bytes);
        } catch (const qv::fen::exception::Exception& e) {
            EXPECT_NE(dynamic_cast<const DocumentFormatError*>(&e), nullptr);
            EXPECT_NE(std::string(e.what()).find("ends early"), std::string::npos) << e.what();
        }
    }
}
