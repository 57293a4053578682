// urlcheck: parses item URLs given on the command line and shows how they
// are read: the kind, each segment with its separator, and the text the URL
// prints back as. Exit status 0 when every URL parsed, 1 when any failed,
// 2 on a usage error.

#include "fen/OrvekURL.h"
#include "fen/osdep/TextConversion.h"

#include <clocale>
#include <cstdint>
#include <cstdio>
#include <exception>
#include <string>
#include <string_view>

namespace {

using qv::fen::OrvekURL;
using qv::fen::String;
using qv::fen::WString;
using qv::fen::osdep::ToAnsi;
using qv::fen::osdep::ToWide;

const char* KindName(std::uint32_t kind)
{
    switch (kind) {
    case OrvekURL::HostForm: return "HostForm (\\\\host\\process\\path)";
    case OrvekURL::LocalForm: return "LocalForm (\\\\.\\process\\path)";
    case OrvekURL::RootForm: return "RootForm (\\path)";
    case OrvekURL::RelativeForm: return "RelativeForm (path)";
    default: return "unknown";
    }
}

/// Text for the terminal: control characters become <CR>, <LF>, <TAB> or
/// <0xNN> so that a name cannot break or hide in the output. Multi-byte
/// characters of the locale charset never contain such bytes.
std::string Visible(std::string_view text)
{
    static const char kHex[] = "0123456789ABCDEF";
    std::string out;
    for (char c : text) {
        const auto byte = static_cast<unsigned char>(c);
        if (byte == '\r') {
            out += "<CR>";
        } else if (byte == '\n') {
            out += "<LF>";
        } else if (byte == '\t') {
            out += "<TAB>";
        } else if (byte < 0x20 || byte == 0x7F) {
            out += "<0x";
            out += kHex[byte >> 4];
            out += kHex[byte & 0xF];
            out += '>';
        } else {
            out += c;
        }
    }
    return out;
}

std::string Visible(const WString& text)
{
    return Visible(ToAnsi(text).View());
}

void Show(const OrvekURL& url)
{
    std::printf("  kind:     %s\n", KindName(url.GetKind()));
    std::printf("  segments: %zu\n", url.GetSegmentCount());
    for (std::size_t i = 0; i < url.GetSegmentCount(); ++i) {
        const OrvekURL::Segment& segment = url.GetSegment(i);
        const char* separator = segment.HasNoSeparator() ? "-" : (segment.GetSeparator() == u'.' ? "." : "\\");
        if (segment.IsParent())
            std::printf("    %3zu  %s  ..\n", i + 1, separator);
        else
            std::printf("    %3zu  %s  \"%s\"\n", i + 1, separator, Visible(segment.GetName()).c_str());
    }
    std::printf("  printed:  %s\n", Visible(url.ToString()).c_str());
}

/// Parses and shows one argument; false when it is not a valid URL.
bool Check(const char* argument)
{
    std::printf("%s\n", Visible(argument).c_str());
    try {
        const OrvekURL url(ToWide(String(argument)));
        Show(url);
        return true;
    } catch (const std::exception& e) {
        // SyntaxError for a bad URL, or a failure of the text conversion.
        std::printf("  error:    %s\n", Visible(e.what()).c_str());
    }
    return false;
}

} // namespace

int main(int argc, char** argv)
{
    std::setlocale(LC_ALL, "");
    if (argc < 2) {
        std::fprintf(stderr,
                     "usage: urlcheck URL...\n"
                     "Parses each item URL (for example '\\\\host\\process\\a.b') and shows its kind,\n"
                     "its segments and the text it prints back as.\n"
                     "Exit status: 0 all parsed, 1 some failed, 2 usage error.\n");
        return 2;
    }
    bool allParsed = true;
    for (int i = 1; i < argc; ++i) {
        if (i > 1)
            std::printf("\n");
        allParsed = Check(argv[i]) && allParsed;
    }
    return allParsed ? 0 : 1;
}
