// End-to-end throughput of the session run on level files only: a generated 24-hour
// session (24 hourly files, 864,000 records of 100 ms) through the whole tool.
#include <benchmark/benchmark.h>
#include <unistd.h>

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include "app/run_state.h"
#include "platform/console.h"

namespace {

namespace fs = std::filesystem;

constexpr int kHours = 24;
constexpr std::size_t kRecordsPerHour = 36000;

// A session with plausibly varying levels, written once per process.
const std::string& sessionRoot() {
    static const std::string root = [] {
        std::string dir = (fs::temp_directory_path() / "orv_session_bench_XXXXXX").string();
        if (::mkdtemp(dir.data()) == nullptr) std::abort();
        const std::string session = dir + "/sessions/Day";
        fs::create_directories(session + "/data.000");
        std::ofstream(session + "/Day.inf", std::ios::binary)
            << "SESSION NAME: Day\r\nSESSION START: 05/03/2024 00:00:00\r\n"
               "SESSION END: 06/03/2024 00:00:00\r\nTWEIGHT: 125\r\nCALIBRATION: 5.0\r\n";
        std::vector<char> line(128);
        std::uint32_t noise = 12345;
        for (int h = 0; h < kHours; ++h) {
            char name[64];
            std::snprintf(name, sizeof name, "/data.000/20240305_%02d.csv", h);
            std::string text =
                "Session Name,,Day\r\nLogger Serial Number,,4711\r\nDate,,05/03/2024\r\nHour,," +
                std::to_string(h) +
                "\r\nTemperature,, 12.5\r\n"
                "Time,SPL-A,SPL-C,LEQ-A,LEQ-C,Signal Condition,Battery\r\n";
            text.reserve(text.size() + kRecordsPerHour * 44);
            for (std::size_t slot = 0; slot < kRecordsPerHour; ++slot) {
                noise = noise * 1664525U + 1013904223U;
                const double a = 45.0 + 10.0 * std::sin(static_cast<double>(slot) / 900.0) +
                                 static_cast<double>(noise >> 24) / 64.0;
                const int n = std::snprintf(
                    line.data(), line.size(), "%u:%u.%u,%.1f,%.1f,%.1f,%.1f,0,12.6\r\n",
                    static_cast<unsigned>(slot / 600), static_cast<unsigned>(slot / 10 % 60),
                    static_cast<unsigned>(slot % 10), a, a + 12.0, a - 0.3, a + 11.7);
                text.append(line.data(), static_cast<std::size_t>(n));
            }
            std::ofstream(session + name, std::ios::binary) << text;
        }
        return dir;
    }();
    return root;
}

void runSession(benchmark::State& state, const std::vector<std::string>& options) {
    const std::string root = sessionRoot();
    std::vector<std::string> args{"orv_cmd", "-s", root + "/sessions", "-d", root + "/out"};
    args.insert(args.end(), options.begin(), options.end());
    std::vector<const char*> argv;
    for (const auto& a : args) argv.push_back(a.c_str());
    for (auto _ : state) {
        std::string output;
        platform::Console console(&output);
        const int status = orv::runOrvCmd(static_cast<int>(argv.size()), argv.data(), console,
                                          orv::RunEnvironment{});
        if (status != 0) state.SkipWithError("run failed");
        benchmark::DoNotOptimize(output);
    }
    const double records = static_cast<double>(kHours * kRecordsPerHour);
    state.counters["records_per_s"] =
        benchmark::Counter(records, benchmark::Counter::kIsIterationInvariantRate);
}

void BM_Session24h_General15min(benchmark::State& state) { runSession(state, {}); }
void BM_Session24h_General1min_Leq1s(benchmark::State& state) {
    runSession(state, {"-i", "1", "-leq", "1"});
}

BENCHMARK(BM_Session24h_General15min)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(BM_Session24h_General1min_Leq1s)->Unit(benchmark::kMillisecond)->UseRealTime();

}  // namespace

BENCHMARK_MAIN();
