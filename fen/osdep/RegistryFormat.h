#pragma once
/// \file
/// The text of a registry store file: UTF-8 lines, a section per key and a
/// line per value, meant to be read and edited by hand.
///
///     ; comment
///     [Software\Quorvane\Varoscope]
///     "Name"=sz:"text with \"quotes\", \\ and \n escaped"
///     "Path"=expand_sz:"%HOME%/data"
///     "List"=multi_sz:"first","second"
///     "Count"=dword:42
///     "Total"=qword:0x1000000000
///     "Blob"=binary:00 ff 10
///     "Odd"=hex(5):01 00 00 00
///
/// A section names a key by its path below the root ("[]" is the root
/// itself) and creates the key and its missing parents; the values that
/// follow belong to it. Keys and values keep the order of the file. Writing
/// gives a section to every key that holds values or has no subkeys, in
/// depth-first order, so reading the text back restores the same tree.

#include "fen/osdep/RegistryTree.h"

#include <string>
#include <string_view>

namespace qv::fen::osdep::registry {

/// Win32-equivalent code of a store file that cannot be read.
inline constexpr std::uint32_t kErrorCorruptStore = 1009;

/// The tree that `text` describes. A fault throws WinError 1009 whose
/// message names `fileName`, the line and what is wrong.
StoredKey ParseStore(std::string_view text, const std::string& fileName);

/// The text of `root`, headed by a comment naming `rootName`.
std::string FormatStore(const StoredKey& root, std::string_view rootName);

} // namespace qv::fen::osdep::registry
