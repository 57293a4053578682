#pragma once
/// \file
/// Where the service layer keeps its run-time files, and where it finds the
/// programs it runs.
///
/// The runtime directory is `$XDG_RUNTIME_DIR/varoscope`, or the private
/// folder /tmp/varoscope-<uid> when XDG_RUNTIME_DIR is unset or relative.
/// Below it:
///   Global/<name>      the mark of a running service: an exclusive flock
///                      held by its service host; the file is never removed
///   status/<name>      the host's report: state, checkpoint, pids
///   log/<name>.log     standard output and error of the host and service
/// Service names are file names here, so a name holding a slash, a
/// backslash, a NUL or nothing at all, or that is "." or "..", is refused.

#include <string>

namespace qv::fen::osdep {

/// True for a name that can be a service name.
bool IsValidServiceName(const std::string& name) noexcept;

/// The runtime directory, created with mode 0700 when missing. A directory
/// that is a symbolic link, belongs to another user or is open to others is
/// refused, since the marks and status files in it decide what runs. A
/// failure throws WinError.
std::string RuntimeDirectory();

/// A subfolder of the runtime directory, created with mode 0700 when missing.
std::string RuntimeSubdirectory(const char* name);

/// "<runtime>/Global/<name>", "<runtime>/status/<name>", "<runtime>/log/<name>.log";
/// their folders are created on the way. The name must be valid.
std::string MarkPath(const std::string& name);
std::string StatusPath(const std::string& name);
std::string LogPath(const std::string& name);

/// True when some process holds the mark of `name`. A missing mark file
/// means not held; any other failure throws WinError.
bool IsMarkHeld(const std::string& name);

/// The folder of the project's programs: `$VAROSCOPE_BIN_DIR` when set, else
/// the folder of the running program when it holds the service host, else
/// the build's own bin folder.
std::string BinDirectory();

/// The path of a program of ours in BinDirectory(); WinError 2 when it is
/// not there.
std::string FindProgram(const char* program);

/// A data file shipped with the programs, "<bin>/../share/varoscope/<name>";
/// WinError 2 when it is not there.
std::string FindDataFile(const char* name);

/// Writes `bytes` to `path` through a temporary file and a rename, so that
/// a reader sees the old or the new contents; WinError on failure.
void ReplaceFile(const std::string& path, const std::string& bytes);

} // namespace qv::fen::osdep
