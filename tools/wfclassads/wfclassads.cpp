// wfclassads: the service "WfClassAds". Advertises this host: every few
// seconds it writes "<runtime>/classads.json" with the machine's network
// name, the time, the Orvek data port and every defined service with its
// state and process, so that tools and the network's browsing can see what
// this host offers. The file is replaced atomically and removed on stop.
//
// Usage: wfclassads [--interval MS]   (default 5000)

#include "common/DaemonLoop.h"
#include "fen/osdep/MachineIdentity.h"
#include "fen/osdep/OrvekPort.h"
#include "fen/osdep/ServiceDefinition.h"
#include "fen/osdep/ServiceRuntime.h"
#include "fen/osdep/ServiceStatus.h"
#include "fen/osdep/TextConversion.h"

#include <clocale>
#include <cstdio>
#include <sstream>
#include <unistd.h>

namespace {

using namespace qv::fen::osdep;
using qv::tools::JsonString;

std::string Advertisement()
{
    std::ostringstream out;
    out << "{\n  \"host\": " << JsonString(ToAnsi(GetLocalHostName(false)).c_str())
        << ",\n  \"time\": " << JsonString(qv::tools::UtcTimeText()) << ",\n  \"dataPort\": " << GetOrvekDataPort()
        << ",\n  \"services\": [";
    const char* separator = "\n";
    for (const std::string& name : ListServiceNames()) {
        const auto definition = LoadServiceDefinition(name);
        if (!definition)
            continue;
        const ServiceStatus status = QueryServiceStatus(name, definition->waitHint);
        out << separator << "    {\"name\": " << JsonString(name)
            << ", \"displayName\": " << JsonString(definition->displayName)
            << ", \"state\": " << JsonString(ServiceStateName(status.state)) << ", \"pid\": " << status.processId
            << "}";
        separator = ",\n";
    }
    out << "\n  ]\n}\n";
    return out.str();
}

} // namespace

int main(int argc, char** argv)
{
    std::setlocale(LC_ALL, "");
    const auto interval = qv::tools::IntervalOption(argc, argv, std::chrono::milliseconds(5000));
    std::string path;
    return qv::tools::RunPeriodicService(
        "wfclassads", interval,
        [&] {
            if (path.empty())
                path = RuntimeDirectory() + "/classads.json";
            ReplaceFile(path, Advertisement());
        },
        [&] {
            if (!path.empty())
                ::unlink(path.c_str());
        });
}
