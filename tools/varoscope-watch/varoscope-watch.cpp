// varoscope-watch: the watch list for a terminal. Opens a watch list (.vsd)
// or takes item URLs, subscribes them through the monitor's document and
// prints one line per applied change with the list's own texts: short name,
// value, time and quality.

#include "WatchCommandLine.h"

#include "document/MonitorDoc.h"
#include "fen/OrvekURL.h"
#include "fen/osdep/TextConversion.h"
#include "views/watchlist/DocumentDataView.h"

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <chrono>
#include <clocale>
#include <csignal>
#include <cstdio>
#include <memory>
#include <poll.h>
#include <stdexcept>
#include <sys/eventfd.h>
#include <unistd.h>

namespace {

using qv::document::CMonitorDoc;
using qv::views::DocumentDataView;
using qv::views::WatchList;

/// Counts posted changes; a counter cannot lose a notification the way a
/// full pipe could.
int changesPosted = -1;
/// Written by the signal handler.
int stopPosted = -1;

void RequestStop(int)
{
    const std::uint64_t one = 1;
    [[maybe_unused]] const auto written = write(stopPosted, &one, sizeof one);
}

void PostChange()
{
    const std::uint64_t one = 1;
    [[maybe_unused]] const auto written = write(changesPosted, &one, sizeof one);
}

/// Prints the row of `handle`, its short name padded to the list's longest.
void PrintRow(WatchList& list, std::int32_t handle)
{
    const auto row = list.RowOf(handle);
    if (!row)
        return;
    std::size_t width = 0;
    for (int r = 0; r < list.RowCount(); ++r)
        width = std::max(width, list.CellText(r, qv::views::Column::ShortName).size());
    std::printf("%-*s  %s  %s  %s\n", static_cast<int>(width), list.CellText(*row, qv::views::Column::ShortName).c_str(),
                list.CellText(*row, qv::views::Column::Value).c_str(), list.CellText(*row, qv::views::Column::Time).c_str(),
                list.CellText(*row, qv::views::Column::Quality).c_str());
    std::fflush(stdout);
}

/// Applies one change per notification until a stop is asked for or the
/// time is up.
void Watch(WatchList& list, double seconds)
{
    using Clock = std::chrono::steady_clock;
    const auto deadline = Clock::now() + std::chrono::duration_cast<Clock::duration>(std::chrono::duration<double>(seconds));
    pollfd fds[2] = {{changesPosted, POLLIN, 0}, {stopPosted, POLLIN, 0}};
    for (;;) {
        int timeout = -1;
        if (seconds > 0) {
            const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(deadline - Clock::now()).count();
            if (left <= 0)
                return;
            timeout = static_cast<int>(std::min<long long>(left, 1000));
        }
        if (poll(fds, 2, timeout) < 0 && errno != EINTR)
            return;
        if (fds[1].revents & POLLIN)
            return;
        std::uint64_t posted = 0;
        if ((fds[0].revents & POLLIN) && read(changesPosted, &posted, sizeof posted) == sizeof posted) {
            for (; posted > 0; --posted)
                if (const auto handle = list.ApplyNextChange())
                    PrintRow(list, *handle);
        }
    }
}

/// New records for URLs typed on the command line; their type and access
/// rights are not known here, so they are listed as readable.
qv::document::ItemBatch RecordsFor(const std::vector<std::string>& urls)
{
    qv::document::ItemBatch batch;
    for (const std::string& url : urls) {
        try {
            const qv::fen::OrvekURL parsed(qv::fen::osdep::ToWide(qv::fen::String(url.c_str())));
        } catch (const qv::fen::exception::Exception&) {
            throw std::invalid_argument("not an item URL: " + url);
        }
        batch.emplace_back(url, 0, qv::document::AccessBits::Read);
    }
    return batch;
}

int Run(const qv::tools::WatchCommandLine& line)
{
    qv::document::ItemBatch typed = RecordsFor(line.urls); // bad URLs stop us before anything starts
    auto document = std::make_unique<CMonitorDoc>(line.ensureServices);
    auto view = std::make_unique<DocumentDataView>(*document, PostChange);
    WatchList& list = view->List();

    if (line.documentPath.empty() && line.urls.empty()) {
        document->OnNewDocument(); // the monitor's auto-loaded list, if any
        if (list.RowCount() == 0)
            throw std::invalid_argument("nothing to watch: give a watch list or item URLs");
    }
    if (!line.documentPath.empty())
        for (const std::string& message : document->OpenDocument(line.documentPath))
            std::fprintf(stderr, "varoscope-watch: %s\n", message.c_str());
    if (!typed.empty())
        view->FilterAndInsert(typed);

    qv::document::DisplayOptions options = list.Options();
    if (line.digits)
        options.decimalDigits = *line.digits;
    options.hexForRawData = options.hexForRawData || line.hexForRawData;
    options.xxForBadQuality = options.xxForBadQuality || line.xxForBadQuality;
    list.SetOptions(options);
    if (line.user)
        document->Login(qv::fen::osdep::ToWide(qv::fen::String(line.user->c_str())),
                        qv::fen::osdep::ToWide(qv::fen::String(line.password.c_str())), qv::fen::WString());

    Watch(list, line.seconds);

    int status = 0;
    if (line.savePath) {
        try {
            document->SaveDocument(*line.savePath);
        } catch (const std::exception& e) {
            std::fprintf(stderr, "varoscope-watch: cannot save %s: %s\n", line.savePath->c_str(), e.what());
            status = 1;
        }
    }
    view->Shutdown(false);
    return status;
}

} // namespace

int main(int argc, char** argv)
{
    std::setlocale(LC_ALL, "");
    qv::tools::WatchCommandLine line;
    try {
        line = qv::tools::ParseWatchCommandLine(std::vector<std::string>(argv + 1, argv + argc));
    } catch (const std::invalid_argument& e) {
        std::fprintf(stderr, "varoscope-watch: %s\n%s", e.what(), qv::tools::WatchUsage());
        return 2;
    }
    if (line.help) {
        std::fputs(qv::tools::WatchUsage(), stdout);
        return 0;
    }
    changesPosted = eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK);
    stopPosted = eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK);
    if (changesPosted < 0 || stopPosted < 0) {
        std::perror("varoscope-watch: eventfd");
        return 1;
    }
    std::signal(SIGINT, RequestStop);
    std::signal(SIGTERM, RequestStop);
    try {
        return Run(line);
    } catch (const std::invalid_argument& e) {
        std::fprintf(stderr, "varoscope-watch: %s\n", e.what());
        return 2;
    } catch (const std::exception& e) {
        std::fprintf(stderr, "varoscope-watch: %s\n", e.what());
        return 1;
    }
}
