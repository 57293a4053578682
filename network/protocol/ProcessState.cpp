// The process state message.

#include "network/protocol/ProcessState.h"

#include "fen/Exception.h"
#include "network/protocol/JsonFields.h"
#include "network/protocol/ProtocolError.h"

#include <limits>

namespace qv::network::protocol {

using namespace detail;

namespace {

constexpr std::int64_t kMaxPid = std::numeric_limits<std::int32_t>::max();

std::string_view StateName(RunState state)
{
    switch (state) {
    case RunState::Running: return "running";
    case RunState::Stopped: return "stopped";
    case RunState::Failed: return "failed";
    }
    return "failed";
}

} // namespace

std::string EncodeProcessState(const ProcessState& state)
{
    Json json = NewMessage();
    json["state"] = StateName(state.state);
    if (state.pid) {
        if (*state.pid < 1)
            QV_THROW(fen::exception::InvalidArgument());
        json["pid"] = *state.pid;
    }
    if (state.since)
        json["since"] = TimeJson(*state.since);
    return Dump(json);
}

ProcessState DecodeProcessState(std::string_view payload)
{
    const Json json = ParseMessage(payload);
    CheckVersion(json);
    ProcessState state;
    const std::string& name = AsString(Required(json, "state"), "state");
    if (name == "running")
        state.state = RunState::Running;
    else if (name == "stopped")
        state.state = RunState::Stopped;
    else if (name == "failed")
        state.state = RunState::Failed;
    else
        throw ProtocolError("unknown process state \"" + name + "\"");
    if (const Json* pid = Member(json, "pid"))
        state.pid = static_cast<std::int32_t>(AsInteger(*pid, 1, kMaxPid, "pid"));
    if (const Json* since = Member(json, "since"))
        state.since = AsTime(*since, "since");
    return state;
}

std::string LastWillPayload()
{
    return EncodeProcessState(ProcessState{RunState::Failed, std::nullopt, std::nullopt});
}

} // namespace qv::network::protocol
