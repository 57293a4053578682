// Copying values and converting them to the text the watch list shows.

#include "value/VarData.h"

#include <benchmark/benchmark.h>

using namespace qv::value;

namespace {

void BM_CopyNumeric(benchmark::State& state)
{
    const VarData value = VarData::MakeNumeric(21.5, 3);
    for (auto _ : state) {
        VarData copy(value);
        benchmark::DoNotOptimize(copy);
    }
}
BENCHMARK(BM_CopyNumeric);

void BM_CopyText(benchmark::State& state)
{
    const VarData value("boiler drum level high");
    for (auto _ : state) {
        VarData copy(value);
        benchmark::DoNotOptimize(copy);
    }
}
BENCHMARK(BM_CopyText);

void BM_CopyVectorThenWrite(benchmark::State& state)
{
    VarData vector;
    for (std::uint32_t i = 0; i < 100; ++i)
        vector.SetElement(i, VarData::MakeNumeric(i));
    for (auto _ : state) {
        VarData copy(vector);
        copy.SetElement(0, VarData::MakeNumeric(-1)); // copy on write: 100 elements
        benchmark::DoNotOptimize(copy);
    }
}
BENCHMARK(BM_CopyVectorThenWrite);

void ConvertToText(benchmark::State& state, const VarData& value)
{
    for (auto _ : state) {
        VarData text(value);
        text.ConvertTo(TypeCode::AnsiString);
        benchmark::DoNotOptimize(text);
    }
}

void BM_TextOfNumeric(benchmark::State& state) { ConvertToText(state, VarData::MakeNumeric(3.14159265)); }
BENCHMARK(BM_TextOfNumeric);

void BM_TextOfBitField(benchmark::State& state) { ConvertToText(state, VarData::MakeBitField(0xA5A5F00Fu)); }
BENCHMARK(BM_TextOfBitField);

void BM_TextOfTimeValue(benchmark::State& state)
{
    ConvertToText(state, VarData(qv::fen::AbsTimeFromUnixSeconds(1'780'000'000, 0x4000000000000000u)));
}
BENCHMARK(BM_TextOfTimeValue);

} // namespace
