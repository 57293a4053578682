// Every decoder under a bounded run of mutated inputs: whatever the bytes,
// a decoder either returns or throws ProtocolError.

#include "network/protocol/AlarmAck.h"
#include "network/protocol/AlarmMessage.h"
#include "network/protocol/Catalogue.h"
#include "network/protocol/ProcessState.h"
#include "network/protocol/ProtocolError.h"
#include "network/protocol/Topics.h"
#include "network/protocol/ValueMessage.h"
#include "network/protocol/WriteRequest.h"
#include "network/protocol/WriteResult.h"

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <functional>
#include <random>
#include <string>
#include <vector>

using namespace qv::network::protocol;

namespace {

constexpr int kRunsPerSeed = 3000;

const std::vector<std::string> kValueSeeds = {
    R"({"v":1,"value":{"t":3,"n":42.5},"quality":"0x0000000000000000","error":0,"time":{"s":"3786912000","f":"9"}})",
    R"({"v":1,"value":{"t":12295,"e":[{"t":4101,"a":"ok"},{"t":17,"u":"18446744073709551615"},{"t":4101,"a64":"/w=="}]}})",
    R"({"v":1,"value":{"t":4108,"d":[[{"t":3,"n":1},{"t":4105,"r":"3q0="}],[{"t":4102,"u16w":[55296]},{"t":3,"n":"nan"}]]}})",
    R"({"v":1,"value":{"t":4115,"x":{"t":4112,"s":"-1","f":"0"}},"error":-5})",
    R"({"v":1,"value":{"t":4114,"fd":[5,0],"fx":"AQIDBAUGBwg="},"quality":"0x1"})",
    R"({"v":1,"value":{"t":13,"w":7}})",
};

const std::vector<std::string> kOtherSeeds = {
    R"({"v":1,"state":"running","pid":4711,"since":{"s":"1","f":"2"}})",
    R"({"v":1,"variables":[{"path":"a\\'x.y'","type":3,"kind":0,"access":3}],"alarms":[{"id":"a","severity":7,"path":"b"}]})",
    R"({"v":1,"id":"r1","user":"u","value":{"t":2,"b":true}})",
    R"({"v":1,"id":"r1","status":-3,"text":"no"})",
    R"({"v":1,"state":"raised","acknowledged":false,"text":"t","severity":700,"time":{"s":"1","f":"2"},"user":""})",
    R"({"v":1,"user":"u","comment":"c"})",
};

const std::vector<std::function<void(std::string_view)>> kDecoders = {
    [](std::string_view p) { DecodeValueMessage(p); },   [](std::string_view p) { DecodeProcessState(p); },
    [](std::string_view p) { DecodeCatalogue(p); },      [](std::string_view p) { DecodeWriteRequest(p); },
    [](std::string_view p) { DecodeWriteResult(p); },    [](std::string_view p) { DecodeAlarmMessage(p); },
    [](std::string_view p) { DecodeAlarmAck(p); },       [](std::string_view p) { ParseTopic(p); },
};

/// Bytes that JSON gives meaning to, so that mutations reach past the parser.
const std::string kPieces[] = {"{", "}", "[", "]", ",", ":", "\"", "\\", "0", "-", "1e999", "\"t\"", "\"n\"",
                               "null", "true", "{\"t\":12295,\"e\":[", "\"nan\"", "4294967296", "\"%\"", "/"};

std::string Mutate(std::string text, std::mt19937& random)
{
    const int steps = 1 + static_cast<int>(random() % 3);
    for (int s = 0; s < steps; ++s) {
        const std::size_t at = text.empty() ? 0 : random() % (text.size() + 1);
        switch (random() % 5) {
        case 0:
            if (at < text.size())
                text[at] = static_cast<char>(random() % 256);
            break;
        case 1: text.insert(at, kPieces[random() % std::size(kPieces)]); break;
        case 2: text.erase(at, random() % 8); break;
        case 3: text.insert(at, text.substr(random() % (text.size() + 1), random() % 16)); break;
        default: text = text.substr(0, at); break;
        }
    }
    return text;
}

/// Replaces one random node of the JSON tree with a value of another kind.
std::string MutateTree(const std::string& seed, std::mt19937& random)
{
    nlohmann::json json = nlohmann::json::parse(seed);
    std::vector<nlohmann::json*> nodes;
    std::function<void(nlohmann::json&)> collect = [&](nlohmann::json& node) {
        nodes.push_back(&node);
        if (node.is_structured())
            for (auto& child : node)
                collect(child);
    };
    collect(json);
    const nlohmann::json replacements[] = {nullptr, -1, 0, 4294967295ull, 1.5, "", "x", "0x", "-0",
                                           nlohmann::json::array(), nlohmann::json::object(), true,
                                           nlohmann::json::parse(R"({"t":4115})"),
                                           nlohmann::json::parse(R"([{"t":0},{"t":0}])")};
    *nodes[random() % nodes.size()] = replacements[random() % std::size(replacements)];
    return json.dump();
}

void ExpectOnlyProtocolErrors(const std::vector<std::string>& seeds, unsigned seed)
{
    std::mt19937 random(seed);
    int refused = 0;
    for (const std::string& text : seeds) {
        for (int run = 0; run < kRunsPerSeed; ++run) {
            const std::string input = run % 2 == 0 ? Mutate(text, random) : MutateTree(text, random);
            for (const auto& decode : kDecoders) {
                try {
                    decode(input);
                } catch (const ProtocolError&) {
                    ++refused;
                } catch (const std::exception& e) {
                    FAIL() << "input " << input << " threw " << e.what();
                }
            }
        }
    }
    EXPECT_GT(refused, 0);
}

} // namespace

TEST(ProtocolFuzz, DecodersYieldOnlyProtocolErrors)
{
    ExpectOnlyProtocolErrors(kValueSeeds, 1);
    ExpectOnlyProtocolErrors(kOtherSeeds, 2);
}
