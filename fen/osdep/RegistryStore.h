#pragma once
/// \file
/// The files of the registry store: one per root key in the configuration
/// directory, each with a lock file beside it ("<store>.lock").
///
/// A read takes a shared lock on the lock file; a change takes an exclusive
/// one, reads the file again under it, applies the one change and replaces
/// the file atomically. Changes from any number of processes therefore all
/// land, one after the other, and a reader never sees half a file. The lock
/// file is never removed: a process that removed it could lock a new file
/// while another still held the old one.

#include "fen/osdep/RegistryTree.h"

#include <cstdint>
#include <functional>
#include <string>

namespace qv::fen::osdep::registry {

/// The name of the root key of `rootCode` (0 to 5; roots 1, 4 and 5 are the
/// one local-machine root), e.g. "HKEY_CURRENT_USER"; any other code throws
/// WinError 6 (invalid handle).
const char* RootName(std::uint32_t rootCode);

/// The store file of `rootCode` in the configuration directory, e.g.
/// "<dir>/HKEY_CURRENT_USER.reg"; the directory is created when missing.
std::string StoreFileOfRoot(std::uint32_t rootCode);

/// The tree held in `file`; a missing file is an empty store. A file that
/// cannot be read or parsed throws WinError 1009 naming it.
StoredKey ReadStore(const std::string& file);

/// Applies `change` to the tree held in `file` while holding the exclusive
/// lock. `change` returns whether it altered the tree; only then is the file
/// rewritten. When the file cannot be parsed (WinError 1009) or `change`
/// throws, the exception passes on and the file is left untouched.
void ChangeStore(const std::string& file, const std::function<bool(StoredKey& root)>& change);

} // namespace qv::fen::osdep::registry
