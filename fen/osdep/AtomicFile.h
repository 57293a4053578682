#pragma once
/// \file
/// Replacing a file's contents so that readers see either the old or the new
/// bytes, never a mixture, even when the machine stops half-way.

#include <string>
#include <string_view>

namespace qv::fen::osdep {

/// Replaces the file `path` with `bytes`: writes a temporary file in the same
/// directory, flushes it to disk, renames it over `path` and flushes the
/// directory. A new file gets the usual permissions (0666 less the umask);
/// an existing one keeps its permission bits. A failure throws WinError with
/// the code of the errno and leaves `path` as it was, without a temporary
/// file behind.
void WriteFileAtomically(const std::string& path, std::string_view bytes);

} // namespace qv::fen::osdep
