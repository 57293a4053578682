#include "fen/osdep/RegistryFormat.h"

#include "fen/osdep/OSException.h"

#include <charconv>
#include <cstdio>

namespace qv::fen::osdep::registry {
namespace {

// ---- Writing ----

void AppendUtf8(std::string& out, char32_t c)
{
    if (c < 0x80) {
        out.push_back(static_cast<char>(c));
    } else if (c < 0x800) {
        out.push_back(static_cast<char>(0xC0 | (c >> 6)));
        out.push_back(static_cast<char>(0x80 | (c & 0x3F)));
    } else if (c < 0x10000) {
        out.push_back(static_cast<char>(0xE0 | (c >> 12)));
        out.push_back(static_cast<char>(0x80 | ((c >> 6) & 0x3F)));
        out.push_back(static_cast<char>(0x80 | (c & 0x3F)));
    } else {
        out.push_back(static_cast<char>(0xF0 | (c >> 18)));
        out.push_back(static_cast<char>(0x80 | ((c >> 12) & 0x3F)));
        out.push_back(static_cast<char>(0x80 | ((c >> 6) & 0x3F)));
        out.push_back(static_cast<char>(0x80 | (c & 0x3F)));
    }
}

bool IsHighSurrogate(char32_t c) { return c >= 0xD800 && c < 0xDC00; }
bool IsLowSurrogate(char32_t c) { return c >= 0xDC00 && c < 0xE000; }

/// UTF-8 of `text`; when `escape` is set, the escapes of a quoted string
/// stand for quotes, backslashes, control characters and unpaired
/// surrogates, so that every 16-bit text survives the trip.
void AppendText(std::string& out, std::u16string_view text, bool escape)
{
    for (std::size_t i = 0; i < text.size(); ++i) {
        char32_t c = text[i];
        if (IsHighSurrogate(c) && i + 1 < text.size() && IsLowSurrogate(text[i + 1])) {
            AppendUtf8(out, 0x10000 + ((c - 0xD800) << 10) + (text[i + 1] - 0xDC00));
            ++i;
            continue;
        }
        if (escape) {
            switch (c) {
            case u'\\': out += "\\\\"; continue;
            case u'"': out += "\\\""; continue;
            case u'\n': out += "\\n"; continue;
            case u'\r': out += "\\r"; continue;
            case u'\t': out += "\\t"; continue;
            case 0: out += "\\0"; continue;
            default: break;
            }
            if (c < 0x20 || c == 0x7F || IsHighSurrogate(c) || IsLowSurrogate(c)) {
                char code[8];
                std::snprintf(code, sizeof code, "\\u%04X", static_cast<unsigned>(c));
                out += code;
                continue;
            }
        }
        AppendUtf8(out, c);
    }
}

void AppendQuoted(std::string& out, std::u16string_view text)
{
    out.push_back('"');
    AppendText(out, text, true);
    out.push_back('"');
}

void AppendValue(std::string& out, const StoredValue& stored)
{
    const RegValue& value = stored.value;
    AppendQuoted(out, stored.name);
    out.push_back('=');
    switch (value.type) {
    case kRegSz:
        out += "sz:";
        AppendQuoted(out, value.text);
        break;
    case kRegExpandSz:
        out += "expand_sz:";
        AppendQuoted(out, value.text);
        break;
    case kRegMultiSz:
        out += "multi_sz:";
        for (std::size_t i = 0; i < value.list.size(); ++i) {
            if (i > 0)
                out.push_back(',');
            AppendQuoted(out, value.list[i]);
        }
        break;
    case kRegDword:
        out += "dword:" + std::to_string(value.number);
        break;
    case kRegQword:
        out += "qword:" + std::to_string(value.number);
        break;
    default:
        out += value.type == kRegBinary ? "binary:" : "hex(" + std::to_string(value.type) + "):";
        for (std::size_t i = 0; i < value.bytes.size(); ++i) {
            char byte[4];
            std::snprintf(byte, sizeof byte, i == 0 ? "%02x" : " %02x", value.bytes[i]);
            out += byte;
        }
        break;
    }
    out.push_back('\n');
}

void AppendKey(std::string& out, const StoredKey& key, const std::string& path, bool isRoot)
{
    if (!key.Values().empty() || (key.Subkeys().empty() && !isRoot)) {
        out += "\n[" + path + "]\n";
        for (const StoredValue& value : key.Values())
            AppendValue(out, value);
    }
    for (const StoredKey& subkey : key.Subkeys()) {
        std::string subpath = isRoot ? std::string() : path + "\\";
        AppendText(subpath, subkey.Name(), false);
        AppendKey(out, subkey, subpath, false);
    }
}

// ---- Reading ----

/// Reads one line of the file; every fault throws with the line's number.
class LineReader {
public:
    LineReader(std::string_view line, const std::string& fileName, std::size_t number)
        : rest_(line), fileName_(fileName), number_(number)
    {
    }

    [[noreturn]] void Fail(const std::string& reason) const
    {
        const std::string message = "Cannot read the registry store file " + fileName_ + ": line " +
                                    std::to_string(number_) + ": " + reason;
        QV_THROW(WinError(String(message.c_str()), kErrorCorruptStore));
    }

    bool AtEnd() const noexcept { return rest_.empty(); }
    char Peek() const noexcept { return rest_.empty() ? '\0' : rest_.front(); }

    void SkipBlanks()
    {
        while (!rest_.empty() && (rest_.front() == ' ' || rest_.front() == '\t'))
            rest_.remove_prefix(1);
    }

    bool Accept(char c)
    {
        if (rest_.empty() || rest_.front() != c)
            return false;
        rest_.remove_prefix(1);
        return true;
    }

    void Expect(char c, const char* what)
    {
        if (!Accept(c))
            Fail(std::string("expected ") + what);
    }

    /// The text up to (not including) `stop`, which is consumed.
    std::string_view Until(char stop, const char* what)
    {
        const std::size_t end = rest_.find(stop);
        if (end == std::string_view::npos)
            Fail(std::string("expected ") + what);
        const std::string_view text = rest_.substr(0, end);
        rest_.remove_prefix(end + 1);
        return text;
    }

    /// One character of UTF-8, as a code point.
    char32_t Utf8Character()
    {
        const auto byte = [this](std::size_t i) { return static_cast<unsigned char>(rest_[i]); };
        const unsigned char lead = byte(0);
        std::size_t length = 1;
        char32_t c = lead;
        char32_t least = 0;
        if (lead >= 0x80) {
            if (lead >= 0xC2 && lead < 0xE0) {
                length = 2, c = lead & 0x1F, least = 0x80;
            } else if (lead >= 0xE0 && lead < 0xF0) {
                length = 3, c = lead & 0x0F, least = 0x800;
            } else if (lead >= 0xF0 && lead < 0xF5) {
                length = 4, c = lead & 0x07, least = 0x10000;
            } else {
                Fail("invalid UTF-8");
            }
            if (rest_.size() < length)
                Fail("invalid UTF-8");
            for (std::size_t i = 1; i < length; ++i) {
                if ((byte(i) & 0xC0) != 0x80)
                    Fail("invalid UTF-8");
                c = (c << 6) | (byte(i) & 0x3F);
            }
            if (c < least || c > 0x10FFFF || (c >= 0xD800 && c < 0xE000))
                Fail("invalid UTF-8");
        }
        rest_.remove_prefix(length);
        return c;
    }

    static void AppendUtf16(std::u16string& out, char32_t c)
    {
        if (c >= 0x10000) {
            out.push_back(static_cast<char16_t>(0xD800 + ((c - 0x10000) >> 10)));
            out.push_back(static_cast<char16_t>(0xDC00 + ((c - 0x10000) & 0x3FF)));
        } else {
            out.push_back(static_cast<char16_t>(c));
        }
    }

    /// The rest of the line as 16-bit text, without escapes.
    std::u16string PlainText()
    {
        std::u16string text;
        while (!rest_.empty())
            AppendUtf16(text, Utf8Character());
        return text;
    }

    /// A string in double quotes, with its escapes.
    std::u16string Quoted()
    {
        Expect('"', "a string in double quotes");
        std::u16string text;
        for (;;) {
            if (rest_.empty())
                Fail("string without its closing quote");
            if (Accept('"'))
                return text;
            if (!Accept('\\')) {
                AppendUtf16(text, Utf8Character());
                continue;
            }
            if (rest_.empty())
                Fail("string without its closing quote");
            const char escape = rest_.front();
            rest_.remove_prefix(1);
            switch (escape) {
            case '\\': text.push_back(u'\\'); break;
            case '"': text.push_back(u'"'); break;
            case 'n': text.push_back(u'\n'); break;
            case 'r': text.push_back(u'\r'); break;
            case 't': text.push_back(u'\t'); break;
            case '0': text.push_back(u'\0'); break;
            case 'u': {
                std::uint32_t code = 0;
                if (rest_.size() < 4 || !ParseHex(rest_.substr(0, 4), code))
                    Fail("\\u needs four hexadecimal digits");
                rest_.remove_prefix(4);
                text.push_back(static_cast<char16_t>(code));
                break;
            }
            default: Fail(std::string("unknown escape \\") + escape);
            }
        }
    }

    /// A decimal number, or a hexadecimal one after "0x", of at most `max`.
    std::uint64_t Number(std::uint64_t max)
    {
        const std::size_t end = rest_.find_first_of(" \t");
        std::string_view digits = rest_.substr(0, end);
        rest_.remove_prefix(digits.size());
        int base = 10;
        if (digits.size() > 2 && digits[0] == '0' && (digits[1] == 'x' || digits[1] == 'X')) {
            digits.remove_prefix(2);
            base = 16;
        }
        std::uint64_t number = 0;
        const auto [last, error] = std::from_chars(digits.data(), digits.data() + digits.size(), number, base);
        if (digits.empty() || error != std::errc() || last != digits.data() + digits.size())
            Fail("expected a number");
        if (number > max)
            Fail("number out of range");
        return number;
    }

    /// Bytes as pairs of hexadecimal digits, blanks allowed between them.
    std::vector<std::uint8_t> Bytes()
    {
        std::vector<std::uint8_t> bytes;
        for (SkipBlanks(); !rest_.empty(); SkipBlanks()) {
            std::uint32_t byte = 0;
            if (rest_.size() < 2 || !ParseHex(rest_.substr(0, 2), byte))
                Fail("expected bytes as pairs of hexadecimal digits");
            rest_.remove_prefix(2);
            bytes.push_back(static_cast<std::uint8_t>(byte));
        }
        return bytes;
    }

private:
    static bool ParseHex(std::string_view digits, std::uint32_t& value)
    {
        const auto [last, error] = std::from_chars(digits.data(), digits.data() + digits.size(), value, 16);
        return error == std::errc() && last == digits.data() + digits.size();
    }

    std::string_view rest_;
    const std::string& fileName_;
    std::size_t number_;
};

RegValue ReadValueData(LineReader& reader, std::string_view tag)
{
    RegValue value;
    if (tag == "sz" || tag == "expand_sz") {
        value.type = tag == "sz" ? kRegSz : kRegExpandSz;
        value.text = reader.Quoted();
    } else if (tag == "multi_sz") {
        value.type = kRegMultiSz;
        reader.SkipBlanks();
        if (!reader.AtEnd()) {
            do {
                reader.SkipBlanks();
                value.list.push_back(reader.Quoted());
                reader.SkipBlanks();
            } while (reader.Accept(','));
        }
    } else if (tag == "dword" || tag == "qword") {
        value.type = tag == "dword" ? kRegDword : kRegQword;
        value.number = reader.Number(tag == "dword" ? 0xFFFFFFFFu : UINT64_MAX);
    } else if (tag == "binary") {
        value.type = kRegBinary;
        value.bytes = reader.Bytes();
    } else if (tag.size() > 5 && tag.substr(0, 4) == "hex(" && tag.back() == ')') {
        const std::string_view digits = tag.substr(4, tag.size() - 5);
        std::uint32_t type = 0;
        const auto [last, error] = std::from_chars(digits.data(), digits.data() + digits.size(), type);
        if (error != std::errc() || last != digits.data() + digits.size())
            reader.Fail("the type of hex(...) must be a decimal number below 2^32");
        value.type = type;
        if (value.type == kRegSz || value.type == kRegExpandSz || value.type == kRegMultiSz ||
            value.type == kRegDword || value.type == kRegQword || value.type == kRegBinary)
            reader.Fail("type " + std::to_string(type) + " has its own name and is not written as hex(...)");
        value.bytes = reader.Bytes();
    } else {
        reader.Fail("unknown value type \"" + std::string(tag) + "\"");
    }
    return value;
}

} // namespace

StoredKey ParseStore(std::string_view text, const std::string& fileName)
{
    StoredKey root;
    StoredKey* current = nullptr;
    std::size_t number = 0;
    if (text.substr(0, 3) == "\xEF\xBB\xBF")
        text.remove_prefix(3); // the byte-order mark some editors put first
    while (!text.empty()) {
        ++number;
        const std::size_t end = text.find('\n');
        std::string_view line = text.substr(0, end);
        text.remove_prefix(end == std::string_view::npos ? text.size() : end + 1);
        while (!line.empty() && (line.back() == '\r' || line.back() == ' ' || line.back() == '\t'))
            line.remove_suffix(1);

        LineReader reader(line, fileName, number);
        reader.SkipBlanks();
        const char first = reader.Peek();
        if (reader.AtEnd() || first == ';' || first == '#')
            continue;
        if (first == '[') {
            if (line.back() != ']')
                reader.Fail("a key section must end with ']'");
            const std::size_t open = line.find('[');
            LineReader pathReader(line.substr(open + 1, line.size() - open - 2), fileName, number);
            const std::u16string path = pathReader.PlainText();
            std::vector<std::u16string> segments;
            try {
                segments = SplitKeyPath(path);
            } catch (const WinError&) {
                reader.Fail("invalid key path (an empty key name or a control character)");
            }
            bool created = false;
            current = &root.Obtain(segments, created);
            continue;
        }
        if (first != '"')
            reader.Fail("expected a [key] section, a \"name\"=type:data value or a ; comment");
        if (current == nullptr)
            reader.Fail("a value before the first [key] section");
        const std::u16string name = reader.Quoted();
        reader.SkipBlanks();
        reader.Expect('=', "'=' after the value name");
        reader.SkipBlanks();
        std::string_view tag = reader.Until(':', "type:data after '='");
        while (!tag.empty() && (tag.back() == ' ' || tag.back() == '\t'))
            tag.remove_suffix(1);
        reader.SkipBlanks();
        const RegValue value = ReadValueData(reader, tag);
        reader.SkipBlanks();
        if (!reader.AtEnd())
            reader.Fail("unexpected text after the value");
        if (current->FindValue(name) != nullptr)
            reader.Fail("a second value of the same name in one key");
        current->SetValue(name, value);
    }
    return root;
}

std::string FormatStore(const StoredKey& root, std::string_view rootName)
{
    std::string out = "; Varoscope registry store, ";
    out += rootName;
    out += ": a [key path] section per key, a \"name\"=type:data line per value, UTF-8.\n";
    AppendKey(out, root, std::string(), true);
    return out;
}

} // namespace qv::fen::osdep::registry
