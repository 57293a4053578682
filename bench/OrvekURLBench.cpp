// Parsing and printing of item URLs: a typical address, a long one and one
// whose names need quotes.

#include "fen/OrvekURL.h"

#include <benchmark/benchmark.h>

#include <string>

namespace {

using qv::fen::OrvekURL;

std::u16string Typical()
{
    return u"\\\\host\\process\\a.b.c";
}

/// About 300 characters: a host, a process and 40 dotted names.
std::u16string Long()
{
    std::u16string text = u"\\\\plant-controller.example.com\\boiler_house";
    for (int i = 0; i < 40; ++i)
        text += (i % 4 == 0 ? u"\\" : u".") + std::u16string(u"item") + char16_t(u'a' + i % 26);
    return text;
}

std::u16string Quoted()
{
    return u"\\\\host\\'proc.one'\\'it''s here'.'a\\b'.c";
}

void Parse(benchmark::State& state, std::u16string text)
{
    for (auto _ : state) {
        OrvekURL url(text.c_str());
        benchmark::DoNotOptimize(url);
    }
    state.SetItemsProcessed(state.iterations());
    state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(text.size() * sizeof(char16_t)));
}

void Print(benchmark::State& state, std::u16string text)
{
    const OrvekURL url(text.c_str());
    for (auto _ : state) {
        qv::fen::WString printed = url.ToString();
        benchmark::DoNotOptimize(printed);
    }
    state.SetItemsProcessed(state.iterations());
}

BENCHMARK_CAPTURE(Parse, typical, Typical());
BENCHMARK_CAPTURE(Parse, long300, Long());
BENCHMARK_CAPTURE(Parse, quoted, Quoted());
BENCHMARK_CAPTURE(Print, typical, Typical());
BENCHMARK_CAPTURE(Print, long300, Long());
BENCHMARK_CAPTURE(Print, quoted, Quoted());

} // namespace
