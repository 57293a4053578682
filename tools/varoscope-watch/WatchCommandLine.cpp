#include "WatchCommandLine.h"

#include <charconv>
#include <stdexcept>

namespace qv::tools {
namespace {

bool EndsWithVsd(const std::string& text)
{
    if (text.size() < 4)
        return false;
    std::string tail = text.substr(text.size() - 4);
    for (char& c : tail)
        c = static_cast<char>(c >= 'A' && c <= 'Z' ? c - 'A' + 'a' : c);
    return tail == ".vsd";
}

template <typename Number>
Number ParseNumber(const std::string& option, const std::string& text, Number low, Number high)
{
    Number value{};
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error != std::errc() || end != text.data() + text.size() || value < low || value > high)
        throw std::invalid_argument(option + " needs a number from " + std::to_string(low) + " to " +
                                    std::to_string(high) + ", not \"" + text + "\"");
    return value;
}

} // namespace

const char* WatchUsage()
{
    return "usage: varoscope-watch [options] [LIST.vsd] [URL...]\n"
           "Watches items of the Orvek network and prints one line per change:\n"
           "the item's short name, value, time and quality.\n"
           "With neither a list nor URLs, the monitor's auto-loaded list is watched.\n"
           "  --digits N        significant digits of numbers, 1 to 12 (default 12)\n"
           "  --hex             raw data as hexadecimal digits\n"
           "  --xx              XXXXX instead of values of bad quality\n"
           "  --save FILE       save the watch list as FILE (.vsd) at exit\n"
           "  --seconds N       stop after N seconds (default: at Ctrl-C)\n"
           "  --user U          log in as U (with --password W)\n"
           "  --password W\n"
           "  --no-services     do not start this machine's data server\n"
           "  for example: varoscope-watch '\\\\localhost\\boiler\\drum.level'\n";
}

WatchCommandLine ParseWatchCommandLine(const std::vector<std::string>& arguments)
{
    WatchCommandLine line;
    for (std::size_t i = 0; i < arguments.size(); ++i) {
        const std::string& argument = arguments[i];
        auto value = [&]() -> const std::string& {
            if (i + 1 >= arguments.size())
                throw std::invalid_argument(argument + " needs a value");
            return arguments[++i];
        };
        if (argument == "--help" || argument == "-h")
            line.help = true;
        else if (argument == "--digits")
            line.digits = ParseNumber<std::uint32_t>(argument, value(), 1, 12);
        else if (argument == "--hex")
            line.hexForRawData = true;
        else if (argument == "--xx")
            line.xxForBadQuality = true;
        else if (argument == "--save")
            line.savePath = value();
        else if (argument == "--seconds")
            line.seconds = ParseNumber<double>(argument, value(), 0, 1e9);
        else if (argument == "--user")
            line.user = value();
        else if (argument == "--password")
            line.password = value();
        else if (argument == "--no-services")
            line.ensureServices = false;
        else if (argument.starts_with("--"))
            throw std::invalid_argument("unknown option " + argument);
        else if (EndsWithVsd(argument)) {
            if (!line.documentPath.empty())
                throw std::invalid_argument("only one watch list can be opened, not also " + argument);
            line.documentPath = argument;
        } else
            line.urls.push_back(argument);
    }
    return line;
}

} // namespace qv::tools
