#include "value/QualityText.h"

#include <benchmark/benchmark.h>

namespace {

// The three shapes the watch list sees: a healthy value, one condition, and
// a value that has gone bad in several ways at once.
void QualityTextOf(benchmark::State& state, std::uint32_t low, std::uint32_t high)
{
    for (auto _ : state) {
        qv::fen::String text = qv::value::QualityText(low, high, ";");
        benchmark::DoNotOptimize(text.c_str());
    }
}

BENCHMARK_CAPTURE(QualityTextOf, Good, 0u, 0u);
BENCHMARK_CAPTURE(QualityTextOf, OneBit, 0x40u, 0u);
BENCHMARK_CAPTURE(QualityTextOf, SeveralBits, 0x00280012u, 0x10u);
BENCHMARK_CAPTURE(QualityTextOf, EveryBit, 0xFFFFFFFFu, 0xFFFFFFFFu);

} // namespace
