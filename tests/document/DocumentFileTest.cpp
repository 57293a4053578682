#include "document/ArchiveText.h"
#include "document/DocumentFile.h"
#include "fen/osdep/OSException.h"

#include "support/TemporaryHome.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <tuple>
#include <vector>

using namespace std::string_literals;
using namespace qv::document;

namespace {

const WindowPlacement kPlacement{44, 0, ShowCommand::Maximized, -1, -1, -1, -1, 600, 800, 100, 50};

const std::string kPlacementBytes = "\x02" "44\x01" "0\x01" "3\x02-1\x02-1\x02-1\x02-1"
                                    "\x03" "600\x03" "800\x03" "100\x02" "50"s;

const ItemBatch kTwoRows = {
    ItemDataPacket("\\\\h\\p\\a", 5, 3),
    ItemDataPacket("\\\\h\\p\\b.c", 4, 1),
};

/// The two rows above, then the placement.
const std::string kTwoRowsBytes = "\x01" "2"
                                  "\x07\\\\h\\p\\a\x01" "3\x01" "5"
                                  "\x09\\\\h\\p\\b.c\x01" "1\x01" "4"s +
                                  kPlacementBytes;

/// Url, access and dataType of each record, for comparing batches.
std::vector<std::tuple<std::string, int, int>> Rows(const ItemBatch& batch)
{
    std::vector<std::tuple<std::string, int, int>> rows;
    for (const ItemDataPacket& item : batch)
        rows.emplace_back(item.url, item.access, item.dataType);
    return rows;
}

/// A wide text field with a one-byte length, as files written on Windows may hold.
std::string WideField(const std::string& ascii)
{
    std::string out = "\xFF\xFE\xFF"s + static_cast<char>(ascii.size());
    for (char c : ascii)
        out += std::string{c, '\0'};
    return out;
}

} // namespace

TEST(DocumentFile, EncodesRowsTopDownThenThePlacement)
{
    EXPECT_EQ(EncodeDocument(kTwoRows, kPlacement), kTwoRowsBytes);
    const DocumentContents read = DecodeDocument(kTwoRowsBytes);
    EXPECT_EQ(Rows(read.items), Rows(kTwoRows));
    EXPECT_EQ(read.placement, kPlacement);
    EXPECT_TRUE(read.skipped.empty());

    // A 300-character URL takes the 16-bit length form.
    const ItemBatch longRow = {ItemDataPacket("\\\\h\\p\\" + std::string(294, 'x'), 1, 3)};
    const std::string bytes = EncodeDocument(longRow, std::nullopt);
    EXPECT_EQ(bytes.substr(0, 5), "\x01" "1\xFF\x2C\x01"s);
    EXPECT_EQ(Rows(DecodeDocument(bytes).items), Rows(longRow));

    // An empty list: the count and the placement only, or the count alone.
    EXPECT_EQ(EncodeDocument({}, kPlacement), "\x01" "0"s + kPlacementBytes);
    EXPECT_EQ(EncodeDocument({}, std::nullopt), "\x01" "0"s);
    const DocumentContents empty = DecodeDocument("\x01" "0"s);
    EXPECT_TRUE(empty.items.empty());
    EXPECT_FALSE(empty.placement.has_value());
}

TEST(DocumentFile, ReadsWideFieldsLongLengthFormsAndPaddedNumbers)
{
    const std::string longUrl = "\\\\h\\p\\" + std::string(400, 'y');
    const std::string bytes = WideField(" 2") +
                              // wide url, then numbers with blanks and trailing text;
                              // access keeps its low 16 bits, -1 becomes 0xFFFF
                              WideField("\\\\h\\p\\w") + "\x06 65539" "\x04\t-1x" +
                              // url with a 16-bit length, numbers in the 32-bit length form
                              "\xFF\x96\x01"s + longUrl + "\xFF\xFF\xFF\x02\x00\x00\x00" " 2"s +
                              WideField("7") +
                              // placement, blanks in front; stale bytes after it are ignored
                              WideField(" 44") + "\x01" "0\x02 2\x02-1\x02-1\x02-1\x02-1" "\x02 9\x01" "8\x01" "7\x01" "6"s +
                              "\x05stale"s;
    const DocumentContents read = DecodeDocument(bytes);
    EXPECT_EQ(Rows(read.items), (decltype(Rows(read.items)){{"\\\\h\\p\\w", 3, 0xFFFF}, {longUrl, 2, 7}}));
    EXPECT_EQ(read.placement, (WindowPlacement{44, 0, 2, -1, -1, -1, -1, 9, 8, 7, 6}));
}

TEST(DocumentFile, DamagedFilesThrowAndYieldNothing)
{
    // Every truncation fails, except right after the records, where a file
    // saved without a placement ends.
    const std::size_t recordsEnd = kTwoRowsBytes.size() - kPlacementBytes.size();
    for (std::size_t n = 0; n < kTwoRowsBytes.size(); ++n) {
        if (n == recordsEnd) {
            EXPECT_FALSE(DecodeDocument(kTwoRowsBytes.substr(0, n)).placement.has_value());
            continue;
        }
        EXPECT_THROW(DecodeDocument(kTwoRowsBytes.substr(0, n)), DocumentFormatError) << n << " bytes";
    }

    // A count far beyond the data, and a length that claims 2 GiB.
    EXPECT_THROW(DecodeDocument("\x0A" "2147483647\x01" "a\x01" "1\x01" "1"s), DocumentFormatError);
    EXPECT_THROW(DecodeDocument("\x01" "1\xFF\xFF\xFF\xFF\xFF\xFF\x7F" "abc"s), DocumentFormatError);

    // A negative count reads no records; what follows is the placement.
    const DocumentContents negative = DecodeDocument("\x02-5"s + kPlacementBytes);
    EXPECT_TRUE(negative.items.empty());
    EXPECT_EQ(negative.placement, kPlacement);
}

TEST(DocumentFile, SkipsRecordsWithAnInvalidUrlAndNamesThem)
{
    const ItemBatch rows = {kTwoRows[0], ItemDataPacket("a..b", 1, 1), kTwoRows[1]};
    const DocumentContents read = DecodeDocument(EncodeDocument(rows, kPlacement));
    EXPECT_EQ(Rows(read.items), Rows(kTwoRows));
    ASSERT_EQ(read.skipped.size(), 1u);
    EXPECT_NE(read.skipped[0].find("\"a..b\""), std::string::npos) << read.skipped[0];
    EXPECT_EQ(read.placement, kPlacement);
}

TEST(DocumentFile, SavesAtomicallyAndLoadsBack)
{
    const qv::test::TemporaryHome home;
    const std::string path = (home.Home() / "watch.vsd").string();
    std::ofstream(path, std::ios::binary) << std::string(5000, 'z'); // longer than the new file
    SaveDocument(path, kTwoRows, kPlacement);

    std::ifstream in(path, std::ios::binary);
    EXPECT_EQ(std::string(std::istreambuf_iterator<char>(in), {}), kTwoRowsBytes);
    EXPECT_EQ(std::distance(std::filesystem::directory_iterator(home.Home()), {}), 1) << "a temporary file is left";

    const DocumentContents read = LoadDocument(path);
    EXPECT_EQ(Rows(read.items), Rows(kTwoRows));
    EXPECT_EQ(read.placement, kPlacement);

    try {
        LoadDocument(path + ".missing");
        ADD_FAILURE() << "a missing file loaded";
    } catch (const qv::fen::osdep::WinError& e) {
        EXPECT_EQ(e.GetOSErrorCode(), 2u);
        EXPECT_NE(std::string(e.what()).find("watch.vsd.missing"), std::string::npos) << e.what();
    }
    EXPECT_THROW(LoadDocument(home.Home().string()), qv::fen::osdep::WinError);
    EXPECT_THROW(LoadDocument("/dev/zero"), qv::fen::osdep::WinError) << "a device never ends";
}

TEST(DocumentFile, TitleIsTheFileNameWithoutDirectoryAndExtension)
{
    EXPECT_EQ(DocumentTitle("/home/u/.config/varoscope/AutoLoad.vsd"), "AutoLoad");
    EXPECT_EQ(DocumentTitle("plant.v2.vsd"), "plant.v2");
    EXPECT_EQ(DocumentTitle("/tmp/noext"), "noext");
}
