#pragma once
/// \file
/// The command line of varoscope-watch.

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace qv::tools {

struct WatchCommandLine {
    /// A watch list to open (".vsd").
    std::string documentPath;
    /// Item URLs to add after the document's.
    std::vector<std::string> urls;
    /// Significant digits of numbers, 1 to 12.
    std::optional<std::uint32_t> digits;
    bool hexForRawData = false;
    bool xxForBadQuality = false;
    /// Where to save the watch list at exit.
    std::optional<std::string> savePath;
    /// Stop after this many seconds; 0 runs until interrupted.
    double seconds = 0;
    /// Start this machine's data server and helpers when they are not running.
    bool ensureServices = true;
    std::optional<std::string> user;
    std::string password;
    bool help = false;
};

/// The usage text.
const char* WatchUsage();

/// Reads `arguments` (without the program name). Throws std::invalid_argument
/// with a message for the user on a bad option or value.
WatchCommandLine ParseWatchCommandLine(const std::vector<std::string>& arguments);

} // namespace qv::tools
