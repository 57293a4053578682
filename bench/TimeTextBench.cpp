// Time text as the value conversion makes it (explicit formats, three
// digits, UTC) and as the data view makes it (the locale's formats, local
// time).

#include "fen/osdep/TimeText.h"

#include <benchmark/benchmark.h>

namespace {

using qv::fen::AbsTime;
using namespace qv::fen::osdep;

AbsTime SampleTime()
{
    return qv::fen::AbsTimeFromUnixSeconds(1'717'675'209, qv::fen::FractionOfSecond(123'456, 1'000'000));
}

void ExplicitFormatsUtc(benchmark::State& state)
{
    const AbsTime time = SampleTime();
    for (auto _ : state)
        benchmark::DoNotOptimize(
            AbsTimeToString(time, u"%Y-%m-%d", u"%H:%M:%S", 3, kShowUtc, false, nullptr, kFullStopSeparator));
}
BENCHMARK(ExplicitFormatsUtc);

void LocaleFormatsLocalTime(benchmark::State& state)
{
    const AbsTime time = SampleTime();
    for (auto _ : state)
        benchmark::DoNotOptimize(
            AbsTimeToString(time, nullptr, nullptr, 0, kShowLocalTime, false, nullptr, kLocaleSeparator));
}
BENCHMARK(LocaleFormatsLocalTime);

} // namespace
