#pragma once
/// \file
/// Where the program keeps its per-user files: the registry store, the
/// options file and the auto-load document.

#include <string>

namespace qv::fen::osdep {

/// The per-user configuration directory: `$VAROSCOPE_HOME` when set, else
/// `$XDG_CONFIG_HOME/varoscope`, else `$HOME/.config/varoscope` (the home
/// directory of the user's account when HOME is unset). Empty variables
/// count as unset, and so does a relative XDG_CONFIG_HOME. The directory is
/// created, with any missing parents, with mode 0700 when it does not exist;
/// the environment is read on every call. A failure throws WinError.
std::string ConfigDirectory();

} // namespace qv::fen::osdep
