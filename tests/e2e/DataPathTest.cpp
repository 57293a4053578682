// Values on their way from a publishing process through the broker to a
// monitor and back: every type unchanged, writes, the hand-made process of
// the protocol page, and the demo plant live.

#include "EndToEndSupport.h"
#include "network/SimulatorProcess.h"

#include "network/protocol/Catalogue.h"
#include "network/protocol/VarDataJson.h"

#include <fstream>
#include <limits>
#include <mutex>
#include <set>
#include <spawn.h>
#include <sstream>

namespace qv::test {
namespace {

namespace proto = network::protocol;
using network::publisher::Publisher;
using network::publisher::WriteDecision;
using network::publisher::WriteRequestInfo;
using value::VarData;
namespace TypeCode = value::TypeCode;

using E2EData = EndToEnd;

VarData FromJson(const char* text)
{
    return proto::VarDataFromJson(nlohmann::json::parse(text));
}

VarData Wrapped(VarData value)
{
    value.ConvertTo(TypeCode::FlexData);
    return value;
}

std::string Json(const VarData& value)
{
    return proto::VarDataToJson(value).dump();
}

std::u16string Url(const std::string& process, const std::string& path)
{
    std::u16string url = u"\\\\localhost\\";
    for (char c : process + "\\" + path)
        url += static_cast<char16_t>(c);
    return url;
}

TEST_F(E2EData, EveryPublishedTypeReachesTheSubscriptionUnchanged)
{
    const std::uint8_t bytes[] = {0, 1, 0x7F, 0x80, 0xFE, 0xFF};
    const std::uint16_t descriptor[] = {0x0005, 0x0000};
    const std::uint8_t variantData[] = {1, 2, 3, 4, 5, 6, 7, 8};
    VarData dictionary = VarData::NewDictionary();
    dictionary[VarData("list")].SetElement(2, VarData::MakeNumeric(7, 3));
    dictionary[VarData::MakeNumeric(-1)] = VarData(u"x");
    dictionary[VarData::MakeLogical(true)] = VarData::NewDictionary();
    VarData vector = VarData::MakeUInt64(~0ull);
    vector.SetElement(2, dictionary); // a gap, then the dictionary

    // Each type once, with the publisher's numeric kinds and sub-types; the
    // edge values of each type are the codec's own tests.
    const struct {
        const char* name;
        VarData value;
    } cases[] = {
        {"empty", VarData()},
        {"null", VarData::MakeTyped(TypeCode::Null)},
        {"logical", VarData::MakeLogical(true)},
        {"float64", VarData::MakeNumeric(0.1)},
        {"int16", VarData::MakeNumeric(-5, 2)},
        {"bit field", VarData::MakeBitField(0xDEADBEEF)},
        {"time count", VarData::MakeTime(~0ull)},
        {"word32", FromJson(R"({"t":13,"w":4294967295})")},
        {"uint64 2^53+1", VarData::MakeUInt64(9007199254740993ull)},
        {"ansi", VarData("Gr\xC3\xBC\xC3\x9F" "e \"q\" \\ /")},
        {"ansi with sub-type", FromJson(R"({"t":2147487749,"a":"abc"})")},
        {"unicode", VarData(u"\u20AC \U0001F600")},
        {"raw bytes", VarData(bytes, sizeof bytes)},
        {"dictionary", dictionary},
        {"time value", VarData(fen::AbsTime{~0ull, std::numeric_limits<std::int64_t>::max()})},
        {"time number", FromJson(R"({"t":4112,"s":"-1","f":"13835058055282163712"})")},
        {"foreign variant", VarData::MakeFBVariant(descriptor, 2, variantData, sizeof variantData)},
        {"flex", Wrapped(VarData::MakeNumeric(2.5, 2))},
        {"vector", vector},
        {"unknown code", VarData::MakeTyped(0xABCD0077)},
    };
    constexpr std::size_t kCount = std::size(cases);

    // The process's own quality bits, error codes and times go along unchanged.
    auto quality = [](std::size_t i) { return i % 2 == 0 ? 0 : (0x4000001ull | (std::uint64_t{i} << 32)); };
    auto error = [](std::size_t i) { return -static_cast<std::int32_t>(i); };
    auto time = [](std::size_t i) { return fen::AbsTime{std::uint64_t{i} << 40, 3786912000 + static_cast<std::int64_t>(i)}; };

    Publisher publisher("all types", PublisherOn());
    for (std::size_t i = 0; i < kCount; ++i) {
        const VarData& value = cases[i].value;
        const std::uint8_t kind = value.Code() == TypeCode::Numeric ? static_cast<std::uint8_t>(value.Kind()) : 0;
        const std::string path = "v" + std::to_string(i);
        publisher.DeclareVariable(path, value.Code(), kind, proto::Access::Read);
        publisher.Publish(path, value, quality(i), error(i), time(i));
    }
    Start(publisher);

    Monitor monitor;
    for (std::size_t i = 0; i < kCount; ++i)
        monitor.Subscribe(Url("all types", "v" + std::to_string(i)).c_str(), static_cast<std::int32_t>(i));
    for (std::size_t i = 0; i < kCount; ++i) {
        SCOPED_TRACE(cases[i].name);
        const auto change = monitor.Receiver().WaitFor(static_cast<std::int32_t>(i), Settled);
        ASSERT_TRUE(change);
        EXPECT_EQ(change->value, Json(cases[i].value)); // the type word and every bit, element and byte
        EXPECT_EQ(change->quality, quality(i));
        EXPECT_EQ(change->error, error(i));
        EXPECT_EQ(change->time, time(i));
    }
}

TEST_F(E2EData, WriteRoundTripsThroughTheOwningProcess)
{
    StartBroker({{{"plant", "p-secret"}, {"operator", "o-secret"}}, "", true, ""});
    std::mutex mutex; // outlives the publisher, whose thread runs the handler
    std::vector<WriteRequestInfo> requests;
    Publisher boiler("boiler", PublisherOn("plant", "p-secret"));
    boiler.DeclareVariable("drum.level", TypeCode::Numeric, 0, proto::Access::Read);
    boiler.DeclareVariable("drum.level.setpoint", TypeCode::Numeric,
                           static_cast<std::uint8_t>(value::NumericKind::Float32),
                           proto::Access::Read | proto::Access::Write);
    boiler.Publish("drum.level", VarData::MakeNumeric(10));
    boiler.Publish("drum.level.setpoint", VarData::MakeNumeric(50));
    boiler.SetWriteHandler([&](const WriteRequestInfo& request, VarData&) {
        std::lock_guard lock(mutex);
        requests.push_back(request);
        return WriteDecision{};
    });
    Start(boiler, "plant", "p-secret");
    Monitor monitor;
    ASSERT_EQ(monitor.Login(u"operator", u"o-secret"), network::session::kStatusOk);
    auto* level = monitor.Subscribe(u"\\\\localhost\\boiler\\drum.level", 1);
    auto* setPoint = monitor.Subscribe(u"\\\\localhost\\boiler\\drum.level.setpoint", 2);
    ASSERT_TRUE(monitor.Receiver().WaitFor(1, Settled));
    const auto before = monitor.Receiver().WaitFor(2, Settled);
    ASSERT_TRUE(before);
    ASSERT_EQ(before->data.ToDouble(), 50.0);

    // A read-only variable: the process refuses, nothing changes. The writes
    // travel in order on one connection, so once the second is seen the first
    // has been dealt with.
    EXPECT_EQ(level->Write(VarData::MakeNumeric(99)), 0);
    EXPECT_EQ(setPoint->Write(VarData::MakeNumeric(61.25)), 0);
    const auto written = monitor.Receiver().WaitFor(2, [](const auto&) { return true; });
    ASSERT_TRUE(written);
    EXPECT_EQ(written->data.TypeWord(), 0x70003u); // the variable's kind, not the writer's
    EXPECT_EQ(written->data.ToDouble(), 61.25);
    EXPECT_EQ(written->quality, 0u);
    EXPECT_EQ(boiler.Value("drum.level.setpoint").ToDouble(), 61.25);
    EXPECT_EQ(boiler.Value("drum.level").ToDouble(), 10.0);
    EXPECT_EQ(monitor.Receiver().Changes(1).back().data.ToDouble(), 10.0);

    std::lock_guard lock(mutex);
    ASSERT_EQ(requests.size(), 1u);
    EXPECT_EQ(requests[0].path, "drum.level.setpoint");
    EXPECT_EQ(requests[0].user, "operator"); // the session's login goes with the request
}

/// The shell blocks (```sh) of the page's mosquitto_pub example that publish,
/// with the data port replaced by `port`; the interactive mosquitto_sub block
/// is left out.
std::vector<std::string> ExampleCommands(std::uint16_t port)
{
    std::ifstream file(PROTOCOL_PAGE);
    std::stringstream text;
    text << file.rdbuf();
    const std::string page = text.str();
    const auto section = page.find("## Example: publish a variable with mosquitto_pub");
    std::vector<std::string> blocks;
    if (section == std::string::npos) {
        ADD_FAILURE() << "no mosquitto_pub example in " << PROTOCOL_PAGE;
        return blocks;
    }
    const std::string open = "```sh\n";
    const std::string close = "```";
    for (auto start = page.find(open, section); start != std::string::npos; start = page.find(open, start)) {
        start += open.size();
        const auto end = page.find(close, start);
        if (end == std::string::npos)
            break;
        std::string commands = page.substr(start, end - start);
        start = end + close.size();
        if (commands.find("mosquitto_sub") != std::string::npos)
            continue;
        const std::string defaultPort = "-p 18883 ";
        EXPECT_NE(commands.find(defaultPort), std::string::npos) << commands;
        const std::string testPort = "-p " + std::to_string(port) + " ";
        for (auto at = commands.find(defaultPort); at != std::string::npos;
             at = commands.find(defaultPort, at + testPort.size()))
            commands.replace(at, defaultPort.size(), testPort);
        blocks.push_back(commands);
    }
    return blocks;
}

/// Runs `commands` with /bin/sh, finding mosquitto_pub in /usr/bin; the exit status.
int RunShell(const std::string& commands)
{
    const char* argv[] = {"sh", "-e", "-c", commands.c_str(), nullptr};
    const char* environment[] = {"PATH=/usr/bin:/bin", "LC_ALL=C.UTF-8", nullptr};
    pid_t child = 0;
    if (posix_spawn(&child, "/bin/sh", nullptr, nullptr, const_cast<char* const*>(argv),
                    const_cast<char* const*>(environment))
        != 0)
        return -1;
    int status = 0;
    waitpid(child, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

TEST_F(E2EData, ProtocolPageExampleIsShownByTheMonitor)
{
    const auto blocks = ExampleCommands(broker_->Port());
    ASSERT_EQ(blocks.size(), 3u); // publish, a new value stamped now, take the process away

    ASSERT_EQ(RunShell(blocks[0]), 0) << blocks[0];
    Monitor monitor;
    monitor.Subscribe(u"\\\\localhost\\boiler\\drum.level", 1);
    const auto shown = monitor.Receiver().WaitFor(1, Settled);
    ASSERT_TRUE(shown);
    EXPECT_EQ(shown->data.TypeWord(), TypeCode::Numeric);
    EXPECT_EQ(shown->data.ToDouble(), 42.5);
    EXPECT_EQ(shown->quality, 0u);
    EXPECT_EQ(shown->error, 0);
    EXPECT_EQ(shown->time, (fen::AbsTime{1ull << 63, 3786912000}));

    const fen::AbsTime before = network::publisher::CurrentTime();
    ASSERT_EQ(RunShell(blocks[1]), 0) << blocks[1];
    const auto now = monitor.Receiver().WaitFor(1, [](const auto&) { return true; });
    ASSERT_TRUE(now);
    EXPECT_EQ(now->data.ToDouble(), 43.0);
    EXPECT_EQ(now->quality, 0u);
    EXPECT_GE(now->time.seconds, before.seconds - 1);
    EXPECT_LE(now->time.seconds, network::publisher::CurrentTime().seconds);

    ASSERT_EQ(RunShell(blocks[2]), 0) << blocks[2];
    EXPECT_TRUE(monitor.Receiver().WaitForQuality(1, Q::Nonexistant));
}

TEST_F(E2EData, DemoPlantIsSeenLive)
{
    Simulator sim({"--port", std::to_string(broker_->Port()), "--seconds", "8"});
    Monitor monitor;
    monitor.Subscribe(u"\\\\localhost\\boiler\\drum.level", 1);

    // Values keep changing while the plant runs (a sensor failure now and
    // then only adds its quality bit).
    std::set<std::string> levels;
    const auto deadline = std::chrono::steady_clock::now() + 5s;
    while (levels.size() < 3 && std::chrono::steady_clock::now() < deadline) {
        const auto change = monitor.Receiver().WaitFor(1, [](const RecordedChange& c) {
            return c.data.Code() == TypeCode::Numeric
                   && (c.quality & (Q::Nonexistant | Q::NoKnownValue | Q::ProcessFailure)) == 0;
        });
        if (change)
            levels.insert(change->value);
    }
    EXPECT_GE(levels.size(), 3u);

    // An orderly stop: the plant's values stay, marked as its process's failure to run.
    sim.Signal(SIGTERM);
    EXPECT_EQ(sim.Wait(5s), 0);
    const auto stopped = monitor.Receiver().WaitForQuality(1, Q::ProcessFailure);
    ASSERT_TRUE(stopped);
    EXPECT_EQ(stopped->data.Code(), TypeCode::Numeric);
}

} // namespace
} // namespace qv::test
