#pragma once
/// \file
/// The document file (".vsd"): the watch list's items and the main window's
/// placement, as text and number fields (ArchiveText.h), in this order:
///
///  1. the number of items;
///  2. per item, from the top row of the list down: url, access, dataType;
///  3. the window placement, 11 numbers in WindowPlacement's order.
///
/// There is no magic number, version or checksum. Bytes after the placement
/// are ignored.

#include "document/ItemDataPacket.h"

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace qv::document {

/// Show states of WindowPlacement::showCommand.
namespace ShowCommand {
inline constexpr std::int32_t Normal = 1;
inline constexpr std::int32_t Minimized = 2;
inline constexpr std::int32_t Maximized = 3;
} // namespace ShowCommand

/// The main window's position, size and show state, field for field in the
/// order of the file. Positions are screen pixels; the normal rectangle is
/// the window's frame when it is neither minimised nor maximised.
struct WindowPlacement {
    std::int32_t length = 44;
    std::int32_t flags = 0;
    std::int32_t showCommand = ShowCommand::Normal;
    std::int32_t minimizedX = -1;
    std::int32_t minimizedY = -1;
    std::int32_t maximizedX = -1;
    std::int32_t maximizedY = -1;
    std::int32_t normalBottom = 0;
    std::int32_t normalRight = 0;
    std::int32_t normalLeft = 0;
    std::int32_t normalTop = 0;

    friend bool operator==(const WindowPlacement&, const WindowPlacement&) = default;
};

/// What a document file holds.
struct DocumentContents {
    /// New records, in file order: the top row of the list that saved the
    /// file comes first.
    ItemBatch items;
    /// Absent when the file ends right after its items (a file saved while
    /// no placement could be read).
    std::optional<WindowPlacement> placement;
    /// One message per record that was left out because its URL is not a
    /// valid item URL; each names the URL.
    std::vector<std::string> skipped;
};

/// The bytes of a document holding `rows` (top row first; only url, access
/// and dataType are stored) and, when given, the window placement.
std::string EncodeDocument(std::span<const ItemDataPacket> rows, const std::optional<WindowPlacement>& placement);

/// Reads a whole document from `bytes`. All or nothing: bytes that end early
/// or hold an impossible length throw DocumentFormatError and yield nothing.
/// A count of 0 or less reads no records; access and dataType keep their low
/// 16 bits; a record whose URL the URL grammar rejects is skipped and listed
/// in `skipped`.
DocumentContents DecodeDocument(std::string_view bytes);

/// Writes the document to `path` atomically: readers and a crash half-way
/// see the old file or the new one, whole. Failures throw WinError and
/// leave the old file as it was.
void SaveDocument(const std::string& path, std::span<const ItemDataPacket> rows,
                  const std::optional<WindowPlacement>& placement);

/// Reads and decodes the file `path`: WinError when it cannot be read,
/// otherwise as DecodeDocument.
DocumentContents LoadDocument(const std::string& path);

/// The whole contents of the file `path`; a file that cannot be opened or
/// read, that is not a regular file, or that is larger than 64 MiB throws
/// WinError naming the path and the reason.
std::string ReadWholeFile(const std::string& path);

/// The title of a document read from `path`: its file name without the
/// directory and without the extension ("AutoLoad" for ".../AutoLoad.vsd").
std::string DocumentTitle(const std::string& path);

} // namespace qv::document
