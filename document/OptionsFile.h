#pragma once
/// \file
/// The options file "qv_vsmb.dat", which keeps the watch list's display
/// options between runs, and where the per-user files of the document layer
/// lie.
///
/// The file holds 6 bytes: autoloadLastView (0 or 1), xxForBadQuality,
/// typeMismatchWarning, hexForRawData, the low 8 bits of decimalDigits and
/// the low 8 bits of columnMask.

#include "document/DisplayOptions.h"

#include <cstddef>
#include <string>
#include <string_view>

namespace qv::document {

inline constexpr char kOptionsFileName[] = "qv_vsmb.dat";
inline constexpr char kAutoLoadFileName[] = "AutoLoad.vsd";
inline constexpr std::size_t kOptionsFileSize = 6;

/// The options file in the per-user configuration directory (which is
/// created when missing; a failure throws WinError).
std::string OptionsFilePath();
/// The auto-load document in the per-user configuration directory.
std::string AutoLoadFilePath();

/// The 6 bytes of the options file.
std::string EncodeOptions(const DisplayOptions& options);

/// Options from the bytes of an options file. Bytes missing from a short
/// file keep the default options; bytes past the sixth are ignored. Unless
/// decimalDigits is from 1 to 12 and the column mask is not 0, the result is
/// the default options altogether.
DisplayOptions DecodeOptions(std::string_view bytes);

/// Reads the options file `path` as DecodeOptions does; a file that is
/// missing or cannot be read gives the default options.
DisplayOptions ReadOptionsFile(const std::string& path);

/// Replaces the options file `path` atomically; a failure throws WinError
/// and leaves the old file as it was.
void WriteOptionsFile(const std::string& path, const DisplayOptions& options);

} // namespace qv::document
