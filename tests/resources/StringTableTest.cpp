#include "resources/CommandTable.h"
#include "resources/DialogTable.h"
#include "resources/StringTable.h"

#include <gtest/gtest.h>

#include <set>
#include <string>

using namespace qv::resources;

namespace {

void ExpectWellFormed(std::span<const ResourceEntry> table)
{
    ASSERT_FALSE(table.empty());
    std::set<std::uint32_t> ids;
    for (std::size_t i = 0; i < table.size(); ++i) {
        const ResourceEntry& entry = table[i];
        EXPECT_TRUE(ids.insert(entry.id).second) << "id " << entry.id << " twice";
        if (i > 0) {
            EXPECT_LT(table[i - 1].id, entry.id) << "out of order at " << entry.id;
        }
        EXPECT_FALSE(entry.text.empty()) << entry.id;
        // Callers hand data() to C interfaces.
        EXPECT_EQ(entry.text.data()[entry.text.size()], '\0') << entry.id;
    }
}

} // namespace

TEST(StringTable, EveryTableIsSortedUniqueAndTerminated)
{
    ExpectWellFormed(StringEntries());
    ExpectWellFormed(CommandEntries());
    ExpectWellFormed(DialogEntries());
}

TEST(StringTable, LookupFindsEveryEntryAndNothingElse)
{
    for (const ResourceEntry& entry : StringEntries()) {
        auto text = FindString(entry.id);
        ASSERT_TRUE(text.has_value()) << entry.id;
        EXPECT_EQ(text->data(), entry.text.data());
    }
    for (std::uint32_t absent : {0u, 1u, 127u, 498u, 61291u, 61638u, 0xFFFFFFFFu})
        EXPECT_FALSE(FindString(absent).has_value()) << absent;
}

TEST(StringTable, TextsOtherLayersCompareAgainst)
{
    // Type names.
    EXPECT_EQ(FindString(61290), "Undefined");
    EXPECT_EQ(FindString(497), "NULL");
    EXPECT_EQ(FindString(600), "Time");
    EXPECT_EQ(FindString(603), "Vector");
    EXPECT_EQ(FindString(61284), "ANSI String");
    EXPECT_EQ(FindString(61288), "Raw Byte Data");
    // Access texts, with the backslash itself.
    EXPECT_EQ(FindString(61635), "Read \\ Write");
    EXPECT_EQ(FindString(61630), "No Access");
    // Bad-quality conditions keep their trailing space.
    EXPECT_EQ(FindString(61602), "Sensor Failure ");
    EXPECT_EQ(FindString(61610), "Bad ");
    // Browser node types and the local host.
    EXPECT_EQ(FindString(203), "QV Network Real Time Point");
    EXPECT_EQ(FindString(204), "QV Network Real Time Point Range");
    EXPECT_EQ(FindString(502), "localhost");
    // Registry keys.
    EXPECT_EQ(FindString(200), "SOFTWARE\\Quorvane\\Wayfarer\\4.0\\Machines");
    EXPECT_EQ(FindString(503), "SOFTWARE\\Quorvane\\Varoscope");
    EXPECT_EQ(FindString(61294), "Invalid Timestamp");
    EXPECT_EQ(FindString(61312), "True");
}

TEST(StringTable, DocumentTemplateHasSevenNewlineSeparatedFields)
{
    auto text = FindString(128);
    ASSERT_TRUE(text.has_value());
    std::vector<std::string> fields(1);
    for (char c : *text) {
        if (c == '\n')
            fields.emplace_back();
        else
            fields.back() += c;
    }
    EXPECT_EQ(fields, (std::vector<std::string>{"Quorvane Varnet Monitor", "", "Untitled",
                                                "Variable Monitor Documents (*vsd)", ".vsd", "vsd",
                                                "Variable Monitor Document"}));
}

TEST(StringTable, MenuLabelsAndDialogTitles)
{
    EXPECT_EQ(FindCommandLabel(32771), "&Add\tCtrl+A");
    EXPECT_EQ(FindCommandLabel(32782), "&Add");
    EXPECT_EQ(FindCommandLabel(32794), "&Type Mismatch ");
    EXPECT_FALSE(FindCommandLabel(32774).has_value());
    EXPECT_EQ(FindDialogTitle(143), "Select Value to Write");
    EXPECT_FALSE(FindDialogTitle(128).has_value());
}
