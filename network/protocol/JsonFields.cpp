// Strict JSON members shared by the messages.

#include "network/protocol/JsonFields.h"

#include "fen/Exception.h"
#include "network/protocol/ProtocolError.h"

#include <charconv>
#include <set>
#include <vector>

namespace qv::network::protocol::detail {

namespace {

/// Deeper than any message needs: a value nested to its limit takes three
/// JSON levels per value level.
constexpr int kMaxJsonDepth = 256;

[[noreturn]] void Fail(std::string_view what, std::string_view problem)
{
    throw ProtocolError("\"" + std::string(what) + "\": " + std::string(problem));
}

bool IsDecimal(std::string_view text, bool allowSign) noexcept
{
    if (allowSign && !text.empty() && text.front() == '-') {
        text.remove_prefix(1);
        if (text == "0")
            return false;
    }
    if (text.empty() || (text.size() > 1 && text.front() == '0'))
        return false;
    for (const char c : text)
        if (c < '0' || c > '9')
            return false;
    return true;
}

template <typename T>
T ParseDecimal(const Json& value, std::string_view what)
{
    const std::string& text = AsString(value, what);
    T number{};
    if (!IsDecimal(text, std::is_signed_v<T>))
        Fail(what, "expected decimal digits, got \"" + text + "\"");
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    if (error != std::errc() || end != text.data() + text.size())
        Fail(what, "number \"" + text + "\" out of range");
    return number;
}

} // namespace

Json ParseMessage(std::string_view payload)
{
    // Member names seen so far in each open object, innermost last.
    std::vector<std::set<std::string>> names;
    const Json::parser_callback_t check = [&names](int depth, Json::parse_event_t event, Json& parsed) {
        if (depth > kMaxJsonDepth)
            throw ProtocolError("JSON nested deeper than " + std::to_string(kMaxJsonDepth) + " levels");
        switch (event) {
        case Json::parse_event_t::object_start: names.emplace_back(); break;
        case Json::parse_event_t::object_end: names.pop_back(); break;
        case Json::parse_event_t::key:
            if (!names.back().insert(parsed.get<std::string>()).second)
                throw ProtocolError("member \"" + parsed.get<std::string>() + "\" given twice");
            break;
        default: break;
        }
        return true;
    };
    Json message;
    try {
        message = Json::parse(payload.begin(), payload.end(), check);
    } catch (const Json::exception& e) {
        throw ProtocolError(std::string("bad JSON: ") + e.what());
    }
    if (!message.is_object())
        throw ProtocolError("a message is a JSON object");
    return message;
}

void CheckVersion(const Json& message)
{
    const std::int64_t version = AsInteger(Required(message, "v"), 0, INT32_MAX, "v");
    if (version != kMessageVersion)
        throw ProtocolError("message version " + std::to_string(version) + ", expected " +
                            std::to_string(kMessageVersion));
}

Json NewMessage()
{
    return Json{{"v", kMessageVersion}};
}

std::string Dump(const Json& message)
{
    try {
        return message.dump();
    } catch (const Json::type_error&) {
        QV_THROW(fen::exception::InvalidArgument());
    }
}

const Json* Member(const Json& object, std::string_view name)
{
    const auto found = object.find(name);
    return found == object.end() ? nullptr : &*found;
}

const Json& Required(const Json& object, std::string_view name)
{
    const Json* member = Member(object, name);
    if (member == nullptr)
        Fail(name, "missing");
    return *member;
}

const Json& AsObject(const Json& value, std::string_view what)
{
    if (!value.is_object())
        Fail(what, "expected an object");
    return value;
}

const Json& AsArray(const Json& value, std::string_view what)
{
    if (!value.is_array())
        Fail(what, "expected an array");
    return value;
}

const std::string& AsString(const Json& value, std::string_view what)
{
    if (!value.is_string())
        Fail(what, "expected a string");
    return value.get_ref<const std::string&>();
}

bool AsBool(const Json& value, std::string_view what)
{
    if (!value.is_boolean())
        Fail(what, "expected true or false");
    return value.get<bool>();
}

std::int64_t AsInteger(const Json& value, std::int64_t least, std::int64_t most, std::string_view what)
{
    std::int64_t number = 0;
    if (value.is_number_unsigned()) {
        const auto unsignedNumber = value.get<std::uint64_t>();
        if (unsignedNumber > static_cast<std::uint64_t>(most))
            Fail(what, "integer out of range");
        number = static_cast<std::int64_t>(unsignedNumber);
    } else if (value.is_number_integer()) {
        number = value.get<std::int64_t>();
    } else {
        Fail(what, "expected an integer");
    }
    if (number < least || number > most)
        Fail(what, "integer " + std::to_string(number) + " out of range");
    return number;
}

Json UnsignedText(std::uint64_t number)
{
    return std::to_string(number);
}

Json SignedText(std::int64_t number)
{
    return std::to_string(number);
}

std::uint64_t AsUnsignedText(const Json& value, std::string_view what)
{
    return ParseDecimal<std::uint64_t>(value, what);
}

std::int64_t AsSignedText(const Json& value, std::string_view what)
{
    return ParseDecimal<std::int64_t>(value, what);
}

Json TimeJson(const fen::AbsTime& time)
{
    return Json{{"s", SignedText(time.seconds)}, {"f", UnsignedText(time.fraction)}};
}

fen::AbsTime AsTime(const Json& value, std::string_view what)
{
    AsObject(value, what);
    if (value.size() != 2)
        Fail(what, "a time has exactly the members \"s\" and \"f\"");
    return fen::AbsTime{AsUnsignedText(Required(value, "f"), "f"), AsSignedText(Required(value, "s"), "s")};
}

Json QualityJson(std::uint64_t quality)
{
    static constexpr char kHex[] = "0123456789ABCDEF";
    std::string text = "0x";
    for (int shift = 60; shift >= 0; shift -= 4)
        text += kHex[(quality >> shift) & 0xF];
    return text;
}

std::uint64_t AsQuality(const Json& value, std::string_view what)
{
    const std::string& text = AsString(value, what);
    std::uint64_t quality = 0;
    const bool prefixed = text.size() > 2 && text.size() <= 18 && text[0] == '0' && text[1] == 'x';
    const char* digits = text.data() + 2;
    const char* end = text.data() + text.size();
    const auto parsed = prefixed ? std::from_chars(digits, end, quality, 16) : std::from_chars_result{};
    if (!prefixed || parsed.ec != std::errc() || parsed.ptr != end)
        Fail(what, "expected \"0x\" and 1 to 16 hexadecimal digits, got \"" + text + "\"");
    return quality;
}

} // namespace qv::network::protocol::detail
