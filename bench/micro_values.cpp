// What is done with single texts: unescaping, placeholders, paths, and the conversions both ways.
#include "launcher/properties/placeholders.h"
#include "launcher/properties/property_text.h"
#include "platform/linux/paths.h"
#include "platform/linux/wide_strings.h"

#include <benchmark/benchmark.h>
#include <string>

// `piece` again and again, `length` characters in all.
static std::wstring repeated(const std::wstring& piece, int64_t length)
{
    std::wstring text;
    while (text.size() < static_cast<size_t>(length))
        text += piece;
    text.resize(static_cast<size_t>(length));
    return text;
}

static void finish(benchmark::State& state)
{
    state.SetItemsProcessed(state.iterations() * state.range(0));
    state.SetComplexityN(state.range(0));
}

static void unescape(benchmark::State& state, const wchar_t* piece)
{
    const std::wstring text = repeated(piece, state.range(0));
    while (state.KeepRunning()) {
        std::wstring value = text;
        FilterValue(value);
        benchmark::DoNotOptimize(value.data());
    }
    finish(state);
}

static void unescapePlainValue(benchmark::State& state)
{
    unescape(state, L"a plain value ");
}
BENCHMARK(unescapePlainValue)->RangeMultiplier(8)->Range(8, 1 << 15)->Complexity();

static void unescapeEscapedValue(benchmark::State& state)
{
    unescape(state, L"C\\:\\\\a\\u00e9 ");
}
BENCHMARK(unescapeEscapedValue)->RangeMultiplier(8)->Range(8, 1 << 15)->Complexity();

// A list in which the placeholders' property stands last of a few.
static PropertyList someProperties()
{
    PropertyList list;
    for (const wchar_t* key : {L"one", L"two", L"three", L"four"})
        appendProperty(list, key, L"another");
    appendProperty(list, L"name", L"value");
    return list;
}

static void resolveUserPlaceholders(benchmark::State& state)
{
    PropertyList list = someProperties();
    const std::wstring piece = L"${prop.name} ";
    const std::wstring text = repeated(piece, state.range(0) * static_cast<int64_t>(piece.size()));
    while (state.KeepRunning()) {
        std::wstring value = text;
        if (!replaceAllPlaceholders(L"/workspace", L"/rcp", value, list) ||
            value.size() != 6 * static_cast<size_t>(state.range(0)))
            state.SkipWithError("the placeholders are not resolved");
    }
    freeProperties(list);
    finish(state);
}
BENCHMARK(resolveUserPlaceholders)->RangeMultiplier(8)->Range(1, 1 << 12)->Complexity();

static void resolveStandardPlaceholders(benchmark::State& state)
{
    const std::wstring piece = L"${rcp.home} ";
    const std::wstring text = repeated(piece, state.range(0) * static_cast<int64_t>(piece.size()));
    while (state.KeepRunning()) {
        std::wstring value = text;
        if (!replaceStdPlaceholders(L"/workspace", L"/rcp", value) ||
            value.size() != 5 * static_cast<size_t>(state.range(0)))
            state.SkipWithError("the placeholders are not resolved");
    }
    finish(state);
}
BENCHMARK(resolveStandardPlaceholders)->RangeMultiplier(8)->Range(1, 1 << 12)->Complexity();

static void resolveNoPlaceholder(benchmark::State& state)
{
    const PropertyList none;
    const std::wstring text = repeated(L"a plain value ", state.range(0));
    while (state.KeepRunning()) {
        std::wstring value = text;
        if (replaceAllPlaceholders(L"/workspace", L"/rcp", value, none))
            state.SkipWithError("there is no placeholder");
    }
    finish(state);
}
BENCHMARK(resolveNoPlaceholder)->RangeMultiplier(8)->Range(8, 1 << 15)->Complexity();

// The range is a number of segments.
static void foldPath(benchmark::State& state)
{
    const std::wstring piece = L"/opt//platform/./";
    const std::wstring text =
        repeated(piece, state.range(0) / 2 * static_cast<int64_t>(piece.size()));
    while (state.KeepRunning()) {
        std::wstring path = text;
        convertToStandardPathForm(path);
        benchmark::DoNotOptimize(path.data());
    }
    finish(state);
}
BENCHMARK(foldPath)->RangeMultiplier(4)->Range(4, 1 << 10)->Complexity();

static void toOsSeparator(benchmark::State& state)
{
    const std::wstring text = repeated(L"\\opt\\platform", state.range(0));
    while (state.KeepRunning()) {
        std::wstring path = text;
        convertToOsSeparator(path);
        benchmark::DoNotOptimize(path.data());
    }
    finish(state);
}
BENCHMARK(toOsSeparator)->RangeMultiplier(8)->Range(8, 1 << 12)->Complexity();

static void toWide(benchmark::State& state, const wchar_t* piece)
{
    std::string bytes;
    const std::wstring text = repeated(piece, state.range(0));
    if (wstrtocs(bytes, text) <= 0)
        state.SkipWithError("the locale cannot convert it");
    while (state.KeepRunning()) {
        std::wstring out;
        chartowstr(bytes.c_str(), out);
        benchmark::DoNotOptimize(out.data());
    }
    finish(state);
}

static void asciiToWide(benchmark::State& state)
{
    toWide(state, L"/opt/platform");
}
BENCHMARK(asciiToWide)->RangeMultiplier(8)->Range(8, 1 << 15)->Complexity();

static void accentsToWide(benchmark::State& state)
{
    toWide(state, L"/caf\u00e9/\u20ac");
}
BENCHMARK(accentsToWide)->RangeMultiplier(8)->Range(8, 1 << 15)->Complexity();

static void toBytes(benchmark::State& state, const wchar_t* piece)
{
    const std::wstring text = repeated(piece, state.range(0));
    while (state.KeepRunning()) {
        std::string out;
        if (wstrtocs(out, text) <= 0)
            state.SkipWithError("the locale cannot convert it");
        benchmark::DoNotOptimize(out.data());
    }
    finish(state);
}

static void asciiToBytes(benchmark::State& state)
{
    toBytes(state, L"/opt/platform");
}
BENCHMARK(asciiToBytes)->RangeMultiplier(8)->Range(8, 1 << 15)->Complexity();

static void accentsToBytes(benchmark::State& state)
{
    toBytes(state, L"/caf\u00e9/\u20ac");
}
BENCHMARK(accentsToBytes)->RangeMultiplier(8)->Range(8, 1 << 15)->Complexity();
