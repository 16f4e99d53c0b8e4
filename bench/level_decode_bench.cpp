// Decoding speed of level data files: one hourly file of 36,000 records, header and
// records, decoded into a queue that keeps its capacity from file to file.
#include <benchmark/benchmark.h>

#include <cstdio>
#include <string>
#include <vector>

#include "input/level_data.h"

namespace {

// An hour in the logger's layout, with levels that vary like a real recording.
std::vector<char> hourlyFile() {
    std::string text =
        "Session Name,,Bench Session\r\nLogger Serial Number,,SN000123\r\nDate,,17/09/2020\r\n"
        "Hour,,08\r\nTemperature,, 21.5\r\nTime,SPL-A,SPL-C,LEQ-A,LEQ-C,Signal "
        "Condition,Battery\r\n";
    char row[96];
    for (unsigned slot = 0; slot < 36000; ++slot) {
        const double level = 35.0 + static_cast<double>((slot * 7919U) % 600) / 10.0;
        const int n = std::snprintf(row, sizeof row, "%u:%u.%u,%.1f,%.1f,%.1f,%.1f,%u,%.1f\r\n",
                                    slot / 600, slot / 10 % 60, slot % 10, level, level + 12.3,
                                    level - 0.4, level + 11.8, slot % 97 == 0 ? 3U : 0U, 12.6);
        text.append(row, static_cast<std::size_t>(n));
    }
    return {text.begin(), text.end()};
}

void BM_DecodeHourlyFile(benchmark::State& state) {
    const std::vector<char> file = hourlyFile();
    orv::DataFileHeader header;
    orv::LevelRecordQueue queue;
    for (auto _ : state) {
        std::size_t first = 0;
        if (!orv::parseDataFileHeader(file.data(), file.size(), header, first)) {
            state.SkipWithError("header not parsed");
            break;
        }
        orv::decodeLevelRecords(file.data() + first, file.size() - first, queue);
        benchmark::DoNotOptimize(queue.records.data());
        benchmark::ClobberMemory();
    }
    if (queue.size() != 36000) state.SkipWithError("records lost");
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations()) *
                            static_cast<std::int64_t>(file.size()));
    state.counters["records"] = static_cast<double>(queue.size());
}
BENCHMARK(BM_DecodeHourlyFile)->Unit(benchmark::kMillisecond);

}  // namespace

BENCHMARK_MAIN();
