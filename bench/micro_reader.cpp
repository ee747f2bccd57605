// The properties reader: whole files of so many pairs, in memory.
#include "launcher/properties/property_file.h"

#include <benchmark/benchmark.h>
#include <string>
#include <sys/mman.h>
#include <unistd.h>

// A file in memory, and a path to it.
struct MemoryFile {
    explicit MemoryFile(const std::string& text) : fd(memfd_create("properties", MFD_CLOEXEC))
    {
        size_t written = 0;
        while (fd >= 0 && written < text.size()) {
            const ssize_t more = write(fd, text.data() + written, text.size() - written);
            if (more <= 0)
                break;
            written += static_cast<size_t>(more);
        }
        whole = fd >= 0 && written == text.size();
        path = L"/proc/self/fd/" + std::to_wstring(fd);
    }
    ~MemoryFile()
    {
        if (fd >= 0)
            close(fd);
    }
    MemoryFile(const MemoryFile&) = delete;
    MemoryFile& operator=(const MemoryFile&) = delete;

    int fd;
    bool whole = false;
    std::wstring path;
};

// `line` is put behind "key<n>" in each line.
static void readPairs(benchmark::State& state, const char* line)
{
    const auto pairs = static_cast<size_t>(state.range(0));
    std::string text;
    for (size_t n = 0; n < pairs; ++n)
        text += "key" + std::to_string(n) + line;
    const MemoryFile file(text);
    while (state.KeepRunning()) {
        PropertyList list;
        if (!file.whole || !getPropertiesIfPresent(file.path, list) || list.size() != 2 * pairs)
            state.SkipWithError("not all pairs were read");
        freeProperties(list);
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(text.size()));
    state.SetComplexityN(state.range(0));
}

static void readPlainPairs(benchmark::State& state)
{
    readPairs(state, "=a value of some length\n");
}
BENCHMARK(readPlainPairs)->RangeMultiplier(10)->Range(10, 100000)->Complexity();

static void readEscapedPairs(benchmark::State& state)
{
    readPairs(state, " = C\\:\\\\programs\\\\platform \\u00e9\n");
}
BENCHMARK(readEscapedPairs)->RangeMultiplier(10)->Range(10, 100000)->Complexity();

static void readContinuedPairs(benchmark::State& state)
{
    readPairs(state, "=one,\\\n    two,\\\n    three\n");
}
BENCHMARK(readContinuedPairs)->RangeMultiplier(10)->Range(10, 100000)->Complexity();
