// orvek-sub: subscribes to item URLs through the real-time library and
// prints one line per change: the URL, the value text, the time and the
// quality. An operator's quick look at the network without the monitor.
//
//   orvek-sub [--seconds N] URL...

#include "fen/osdep/TextConversion.h"
#include "fen/osdep/TimeText.h"
#include "network/realtime/OrvekRealTime.h"
#include "network/session/OrvekSession.h"
#include "value/QualityText.h"
#include "value/VarData.h"

#include <atomic>
#include <chrono>
#include <clocale>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

namespace realtime = qv::network::realtime;
namespace session = qv::network::session;
using qv::value::VarData;

namespace {

std::atomic<bool> stopRequested{false};

void RequestStop(int) { stopRequested = true; }

std::string ValueText(const VarData& value)
{
    VarData text(value);
    if (text.Code() != qv::value::TypeCode::AnsiString)
        text.ConvertTo(qv::value::TypeCode::AnsiString);
    return std::string(text.GetString().View());
}

std::string TimeText(const qv::fen::AbsTime& time)
{
    try {
        const qv::fen::WString text = qv::fen::osdep::AbsTimeToString(
            time, nullptr, nullptr, 3, qv::fen::osdep::kShowLocalTime, false, nullptr, qv::fen::osdep::kLocaleSeparator);
        return std::string(qv::fen::osdep::ToAnsi(text).View());
    } catch (const qv::fen::exception::Exception&) {
        return "Invalid Timestamp";
    }
}

/// Prints every change; called on the library's threads, so lines are
/// written under one lock.
class PrintingReceiver final : public realtime::IOrvekRealTimeReceiver3 {
public:
    explicit PrintingReceiver(std::vector<std::string> urls) : urls_(std::move(urls)) {}

    std::int32_t QueryInterface(const realtime::Guid&, void** out) override
    {
        *out = nullptr;
        return static_cast<std::int32_t>(0x80004002u);
    }
    std::uint32_t AddRef() override { return 1; }
    std::uint32_t Release() override { return 1; }
    void Notification3() override {}
    void Notification4() override {}
    void Notification5() override {}
    void Notification6() override {}

    void OnDataChange(std::int32_t handle, std::uint32_t, const VarData* value, std::uint64_t quality,
                      std::int32_t errorCode, const qv::fen::AbsTime* timestamp) override
    {
        try {
            std::string line = urls_.at(static_cast<std::size_t>(handle)) + "  " + ValueText(*value) + "  " +
                               TimeText(*timestamp) + "  " +
                               std::string(qv::value::QualityText(static_cast<std::uint32_t>(quality),
                                                                  static_cast<std::uint32_t>(quality >> 32), ";")
                                               .View());
            if (errorCode < 0)
                line += "; error code: " + std::to_string(errorCode);
            std::lock_guard lock(outputLock_);
            std::printf("%s\n", line.c_str());
            std::fflush(stdout);
        } catch (const std::exception& e) {
            std::fprintf(stderr, "orvek-sub: %s\n", e.what());
        }
    }

private:
    std::vector<std::string> urls_;
    std::mutex outputLock_;
};

int Usage()
{
    std::fprintf(stderr, "usage: orvek-sub [--seconds N] URL...\n"
                         "  for example: orvek-sub '\\\\localhost\\boiler\\drum.level'\n");
    return 2;
}

} // namespace

int main(int argc, char** argv)
{
    std::setlocale(LC_ALL, "");
    double seconds = 0;
    std::vector<std::string> urls;
    for (int i = 1; i < argc; ++i) {
        if (std::strcmp(argv[i], "--seconds") == 0 && i + 1 < argc) {
            char* end = nullptr;
            seconds = std::strtod(argv[++i], &end);
            if (end == argv[i] || *end != '\0' || seconds < 0)
                return Usage();
        } else {
            urls.emplace_back(argv[i]);
        }
    }
    if (urls.empty())
        return Usage();

    session::OrvekLibraryStart();
    session::IOrvekSession* orvekSession = nullptr;
    if (!session::NewOrvekSession(&orvekSession)) {
        std::fprintf(stderr, "orvek-sub: no session\n");
        return 1;
    }
    PrintingReceiver receiver(urls);
    realtime::IOrvekRealTime* realTime = nullptr;
    if (!realtime::NewOrvekRealTime(orvekSession, &receiver, &realTime)) {
        std::fprintf(stderr, "orvek-sub: no real-time connection\n");
        orvekSession->Release();
        return 1;
    }
    std::vector<realtime::ISubscription*> subscriptions;
    for (std::size_t i = 0; i < urls.size(); ++i) {
        const qv::fen::WString url = qv::fen::osdep::ToWide(qv::fen::String(urls[i].c_str()));
        realtime::ISubscription* subscription = nullptr;
        if (realTime->Subscribe(url.c_str(), static_cast<std::int32_t>(i), nullptr, &subscription) < 0)
            std::fprintf(stderr, "orvek-sub: cannot subscribe %s\n", urls[i].c_str());
        else
            subscriptions.push_back(subscription);
    }

    std::signal(SIGINT, RequestStop);
    std::signal(SIGTERM, RequestStop);
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::duration<double>(seconds);
    while (!stopRequested && (seconds == 0 || std::chrono::steady_clock::now() < deadline))
        std::this_thread::sleep_for(std::chrono::milliseconds(50));

    for (realtime::ISubscription* subscription : subscriptions)
        subscription->Release();
    realTime->Release();
    orvekSession->Close();
    orvekSession->Release();
    session::OrvekLibraryStop();
    return 0;
}
