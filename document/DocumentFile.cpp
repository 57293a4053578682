#include "document/DocumentFile.h"

#include "document/ArchiveText.h"
#include "fen/OrvekURL.h"
#include "fen/SyntaxError.h"
#include "fen/osdep/AtomicFile.h"
#include "fen/osdep/ErrnoMapping.h"
#include "fen/osdep/OSException.h"
#include "fen/osdep/TextConversion.h"

#include <array>
#include <cerrno>
#include <fcntl.h>
#include <sys/stat.h>
#include <filesystem>
#include <unistd.h>

namespace qv::document {
namespace {

/// The placement's fields in file order.
constexpr std::array<std::int32_t WindowPlacement::*, 11> kPlacementFields = {
    &WindowPlacement::length,       &WindowPlacement::flags,       &WindowPlacement::showCommand,
    &WindowPlacement::minimizedX,   &WindowPlacement::minimizedY,  &WindowPlacement::maximizedX,
    &WindowPlacement::maximizedY,   &WindowPlacement::normalBottom, &WindowPlacement::normalRight,
    &WindowPlacement::normalLeft,   &WindowPlacement::normalTop};

/// Far beyond any watch list (100,000 items of 300-character URLs take
/// about 31 MiB).
constexpr off_t kLargestDocumentFile = 64 << 20;

/// Closes a descriptor on every way out.
struct FileDescriptor {
    int fd;
    ~FileDescriptor()
    {
        if (fd >= 0)
            ::close(fd);
    }
};

bool IsValidItemUrl(const std::string& url)
{
    try {
        const fen::OrvekURL parsed(fen::osdep::ToWide(fen::String(url.data(), url.size())));
        return true;
    } catch (const fen::exception::SyntaxError&) {
        return false;
    }
}

[[noreturn]] void ThrowErrno(const char* action, const std::string& path, int errnoValue)
{
    char buffer[256];
    const std::string message =
        std::string("Cannot ") + action + " " + path + ": " + fen::osdep::ErrnoText(errnoValue, buffer, sizeof buffer);
    QV_THROW(fen::osdep::WinError(fen::String(message.c_str()), fen::osdep::Win32ErrorFromErrno(errnoValue)));
}

} // namespace

std::string EncodeDocument(std::span<const ItemDataPacket> rows, const std::optional<WindowPlacement>& placement)
{
    std::string out;
    AppendNumberField(out, static_cast<std::int64_t>(rows.size()));
    for (const ItemDataPacket& row : rows) {
        AppendTextField(out, row.url);
        AppendNumberField(out, row.access);
        AppendNumberField(out, row.dataType);
    }
    if (placement) {
        for (const auto field : kPlacementFields)
            AppendNumberField(out, (*placement).*field);
    }
    return out;
}

DocumentContents DecodeDocument(std::string_view bytes)
{
    ArchiveReader reader(bytes);
    DocumentContents contents;
    // Records are appended one at a time: each needs at least three bytes
    // of the file, so a corrupt count cannot make the batch outgrow the data.
    const std::int32_t count = reader.ReadNumber();
    for (std::int32_t i = 0; i < count; ++i) {
        std::string url = reader.ReadText();
        const auto access = static_cast<std::uint16_t>(reader.ReadNumber());
        const auto dataType = static_cast<std::uint16_t>(reader.ReadNumber());
        if (IsValidItemUrl(url))
            contents.items.emplace_back(std::move(url), dataType, access);
        else
            contents.skipped.push_back("Skipped the item \"" + url + "\": it is not a valid item URL");
    }
    // A writer that could not read the placement ends the file here; a file
    // that ends anywhere inside the placement is damaged.
    if (!reader.AtEnd()) {
        WindowPlacement placement;
        for (const auto field : kPlacementFields)
            placement.*field = reader.ReadNumber();
        contents.placement = placement;
    }
    return contents;
}

void SaveDocument(const std::string& path, std::span<const ItemDataPacket> rows,
                  const std::optional<WindowPlacement>& placement)
{
    fen::osdep::WriteFileAtomically(path, EncodeDocument(rows, placement));
}

DocumentContents LoadDocument(const std::string& path)
{
    return DecodeDocument(ReadWholeFile(path));
}

std::string ReadWholeFile(const std::string& path)
{
    const FileDescriptor file{::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK)};
    if (file.fd < 0)
        ThrowErrno("open", path, errno);
    // Only a regular file of sane size: a device or a pipe given as a
    // document would never end or exhaust memory.
    struct stat status {};
    if (::fstat(file.fd, &status) != 0)
        ThrowErrno("read", path, errno);
    if (!S_ISREG(status.st_mode))
        ThrowErrno("read", path, EINVAL);
    if (status.st_size > kLargestDocumentFile)
        ThrowErrno("read", path, EFBIG);
    std::string bytes;
    char buffer[65536];
    for (;;) {
        const ssize_t n = ::read(file.fd, buffer, sizeof buffer);
        if (n == 0)
            return bytes;
        if (n < 0 && errno != EINTR)
            ThrowErrno("read", path, errno);
        if (n > 0)
            bytes.append(buffer, static_cast<std::size_t>(n));
        if (bytes.size() > static_cast<std::size_t>(kLargestDocumentFile))
            ThrowErrno("read", path, EFBIG);
    }
}

std::string DocumentTitle(const std::string& path)
{
    return std::filesystem::path(path).stem().string();
}

} // namespace qv::document
