// Topics of the network and the escaping of the names in them.

#include "network/protocol/Topics.h"

#include "fen/Exception.h"
#include "network/protocol/ProtocolError.h"
#include "network/protocol/TextCoding.h"

#include <array>

namespace qv::network::protocol {

namespace {

constexpr std::array<TopicKind, 7> kAllKinds{TopicKind::State, TopicKind::Catalogue,   TopicKind::Value,
                                             TopicKind::Write, TopicKind::WriteResult, TopicKind::Alarm,
                                             TopicKind::AlarmAck};

constexpr char kHexDigits[] = "0123456789ABCDEF";

bool IsPlain(unsigned char c) noexcept
{
    return (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') || (c >= '0' && c <= '9') || c == '.' || c == '_' ||
           c == '~' || c == '-';
}

int UpperHexDigit(char c) noexcept
{
    if (c >= '0' && c <= '9')
        return c - '0';
    if (c >= 'A' && c <= 'F')
        return c - 'A' + 10;
    return -1;
}

/// Index of the process segment of `url`, or throws InvalidArgument.
std::size_t ProcessIndex(const fen::OrvekURL& url)
{
    std::size_t index = 0;
    if (url.GetKind() == fen::OrvekURL::HostForm)
        index = 1;
    else if (url.GetKind() != fen::OrvekURL::LocalForm)
        QV_THROW(fen::exception::InvalidArgument());
    if (url.GetSegmentCount() <= index || url.GetSegment(index).IsParent())
        QV_THROW(fen::exception::InvalidArgument());
    return index;
}

std::string Utf8Of(const fen::WString& text) { return Utf8FromUtf16(text.View()); }

} // namespace

std::string_view TopicKindName(TopicKind kind) noexcept
{
    switch (kind) {
    case TopicKind::State: return "state";
    case TopicKind::Catalogue: return "catalogue";
    case TopicKind::Value: return "value";
    case TopicKind::Write: return "write";
    case TopicKind::WriteResult: return "write-result";
    case TopicKind::Alarm: return "alarm";
    case TopicKind::AlarmAck: return "alarm-ack";
    }
    return "";
}

bool TopicKindHasName(TopicKind kind) noexcept
{
    return kind != TopicKind::State && kind != TopicKind::Catalogue;
}

std::string EscapeTopicLevel(std::string_view name)
{
    if (name.empty())
        return "%";
    std::string level;
    level.reserve(name.size());
    for (const char c : name) {
        const auto byte = static_cast<unsigned char>(c);
        if (IsPlain(byte)) {
            level += c;
        } else {
            level += '%';
            level += kHexDigits[byte >> 4];
            level += kHexDigits[byte & 0xF];
        }
    }
    return level;
}

std::string UnescapeTopicLevel(std::string_view level)
{
    if (level == "%")
        return std::string();
    if (level.empty())
        throw ProtocolError("empty topic level");
    std::string name;
    name.reserve(level.size());
    for (std::size_t i = 0; i < level.size(); ++i) {
        const auto c = static_cast<unsigned char>(level[i]);
        if (IsPlain(c)) {
            name += level[i];
            continue;
        }
        if (c != '%' || level.size() - i < 3)
            throw ProtocolError("bad character in topic level \"" + std::string(level) + "\"");
        const int high = UpperHexDigit(level[i + 1]);
        const int low = UpperHexDigit(level[i + 2]);
        if (high < 0 || low < 0)
            throw ProtocolError("bad escape in topic level \"" + std::string(level) + "\"");
        const auto byte = static_cast<unsigned char>(high * 16 + low);
        if (IsPlain(byte))
            throw ProtocolError("needless escape in topic level \"" + std::string(level) + "\"");
        name += static_cast<char>(byte);
        i += 2;
    }
    return name;
}

std::string ProcessTopic(std::string_view process, TopicKind kind)
{
    std::string topic(kTopicRoot);
    topic += '/';
    topic += EscapeTopicLevel(process);
    topic += '/';
    topic += TopicKindName(kind);
    return topic;
}

std::string NamedTopic(std::string_view process, TopicKind kind, std::string_view name)
{
    return ProcessTopic(process, kind) + '/' + EscapeTopicLevel(name);
}

std::string NamedTopicFilter(std::string_view process, TopicKind kind)
{
    return ProcessTopic(process, kind) + "/+";
}

ParsedTopic ParseTopic(std::string_view topic)
{
    const std::string root = std::string(kTopicRoot) + '/';
    if (topic.substr(0, root.size()) != root)
        throw ProtocolError("topic \"" + std::string(topic) + "\" outside " + std::string(kTopicRoot));
    std::string_view rest = topic.substr(root.size());

    auto nextLevel = [&rest](bool& more) {
        const std::size_t slash = rest.find('/');
        std::string_view level = rest.substr(0, slash);
        more = slash != std::string_view::npos;
        rest = more ? rest.substr(slash + 1) : std::string_view();
        return level;
    };
    bool more = false;
    ParsedTopic parsed{UnescapeTopicLevel(nextLevel(more)), TopicKind::State, std::string()};
    if (!more)
        throw ProtocolError("topic \"" + std::string(topic) + "\" without a kind");
    const std::string_view kindName = nextLevel(more);
    bool known = false;
    for (const TopicKind kind : kAllKinds) {
        if (TopicKindName(kind) == kindName) {
            parsed.kind = kind;
            known = true;
        }
    }
    if (!known)
        throw ProtocolError("unknown topic kind \"" + std::string(kindName) + "\"");
    if (TopicKindHasName(parsed.kind)) {
        if (!more)
            throw ProtocolError("topic \"" + std::string(topic) + "\" without a name");
        parsed.name = UnescapeTopicLevel(nextLevel(more));
    }
    if (more)
        throw ProtocolError("surplus levels in topic \"" + std::string(topic) + "\"");
    return parsed;
}

std::string ProcessName(const fen::OrvekURL& url)
{
    return Utf8Of(url.GetSegment(ProcessIndex(url)).GetName());
}

std::string VariablePath(const fen::OrvekURL& url)
{
    const std::size_t first = ProcessIndex(url) + 1;
    if (url.GetSegmentCount() <= first)
        QV_THROW(fen::exception::InvalidArgument());
    // The path alone, printed as a relative URL: the first segment loses its
    // separator, the others keep theirs and the printer quotes what needs it.
    fen::Vector<fen::OrvekURL::Segment> segments;
    for (std::size_t i = first; i < url.GetSegmentCount(); ++i) {
        const fen::OrvekURL::Segment& segment = url.GetSegment(i);
        if (segment.IsParent())
            QV_THROW(fen::exception::InvalidArgument());
        segments.push_back(fen::OrvekURL::Segment(i == first ? u'\0' : segment.GetSeparator(), segment.GetName()));
    }
    fen::OrvekURL path(u"");
    path.SetSegments(segments);
    return Utf8Of(path.ToString());
}

std::string ValueTopic(const fen::OrvekURL& url)
{
    return NamedTopic(ProcessName(url), TopicKind::Value, VariablePath(url));
}

std::string CanonicalVariablePath(std::string_view path)
{
    const std::u16string text = u"\\\\.\\p\\" + Utf16FromUtf8(path);
    try {
        return VariablePath(fen::OrvekURL(fen::WString(text.data(), text.size())));
    } catch (const fen::exception::Exception&) {
        throw ProtocolError("\"" + std::string(path) + "\" is no variable path");
    }
}

} // namespace qv::network::protocol
