#include "document/OptionsFile.h"

#include "fen/osdep/AtomicFile.h"
#include "fen/osdep/ConfigDirectory.h"

#include <algorithm>
#include <fstream>

namespace qv::document {

std::string OptionsFilePath()
{
    return fen::osdep::ConfigDirectory() + "/" + kOptionsFileName;
}

std::string AutoLoadFilePath()
{
    return fen::osdep::ConfigDirectory() + "/" + kAutoLoadFileName;
}

std::string EncodeOptions(const DisplayOptions& options)
{
    return {static_cast<char>(options.autoloadLastView ? 1 : 0),
            static_cast<char>(options.xxForBadQuality ? 1 : 0),
            static_cast<char>(options.typeMismatchWarning ? 1 : 0),
            static_cast<char>(options.hexForRawData ? 1 : 0),
            static_cast<char>(options.decimalDigits & 0xFF),
            static_cast<char>(options.columnMask)};
}

DisplayOptions DecodeOptions(std::string_view bytes)
{
    // A short file takes the missing bytes from the defaults' own encoding.
    std::string all = EncodeOptions(DisplayOptions{});
    all.replace(0, std::min(bytes.size(), kOptionsFileSize), bytes.substr(0, kOptionsFileSize));
    const auto byte = [&](std::size_t i) { return static_cast<std::uint8_t>(all[i]); };

    DisplayOptions options;
    options.autoloadLastView = byte(0) != 0;
    options.xxForBadQuality = byte(1) != 0;
    options.typeMismatchWarning = byte(2) != 0;
    options.hexForRawData = byte(3) != 0;
    options.decimalDigits = byte(4);
    options.columnMask = byte(5);
    if (options.decimalDigits < 1 || options.decimalDigits > 12 || options.columnMask == 0)
        return DisplayOptions{};
    return options;
}

DisplayOptions ReadOptionsFile(const std::string& path)
{
    std::ifstream in(path, std::ios::binary);
    char bytes[kOptionsFileSize] = {};
    in.read(bytes, sizeof bytes);
    return DecodeOptions(std::string_view(bytes, static_cast<std::size_t>(in.gcount())));
}

void WriteOptionsFile(const std::string& path, const DisplayOptions& options)
{
    fen::osdep::WriteFileAtomically(path, EncodeOptions(options));
}

} // namespace qv::document
