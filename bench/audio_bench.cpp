// The audio path on a generated hour of audio (48 kHz, 345.6 MB) with its level file:
// 1. gating, reading and dispatching without analysis, beside one read of the same file;
// 2. whole runs of the tool with the band analysis, each in a child process: real-time
//    multiple and peak resident memory, with the default workers and with one.
// Usage: audio_bench [minutes of audio, default 60]
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <set>
#include <string>
#include <vector>

#include "analysis/raw_export.h"
#include "app/run_state.h"
#include "input/level_data.h"
#include "platform/files.h"
#include "processing/session_audio.h"

namespace {

namespace fs = std::filesystem;
using Clock = std::chrono::steady_clock;

void put32(std::ofstream& f, std::uint32_t v) { f.write(reinterpret_cast<const char*>(&v), 4); }
void put16(std::ofstream& f, std::uint16_t v) { f.write(reinterpret_cast<const char*>(&v), 2); }

// Noise whose level changes every few seconds, in a session from 12:00:00 of 5 March 2024.
std::string writeSession(const std::string& root, unsigned minutes) {
    const std::string dir = root + "/sessions/Hour";
    fs::create_directories(dir + "/data.000");
    std::ofstream(dir + "/Hour.inf", std::ios::binary)
        << "SESSION NAME: Hour\r\nSESSION START: 05/03/2024 12:00:00\r\n"
           "SESSION END: 05/03/2024 13:00:00\r\nTWEIGHT: 125\r\nCALIBRATION: 20.0\r\n";
    const std::size_t periods = std::size_t{minutes} * 600;
    std::ofstream wave(dir + "/data.000/20240305_120000.wav", std::ios::binary);
    const auto bytes = static_cast<std::uint32_t>(periods * 9600);
    wave.write("RIFF", 4);
    put32(wave, 36 + bytes);
    wave.write("WAVEfmt ", 8);
    put32(wave, 16);
    put16(wave, 1);
    put16(wave, 1);
    put32(wave, 48000);
    put32(wave, 96000);
    put16(wave, 2);
    put16(wave, 16);
    wave.write("data", 4);
    put32(wave, bytes);
    std::vector<std::int16_t> block(4800);
    std::uint32_t noise = 1;
    for (std::size_t p = 0; p < periods; ++p) {
        const double gain = 200.0 + 150.0 * std::sin(static_cast<double>(p) / 40.0);
        for (std::int16_t& s : block) {
            noise = noise * 1664525U + 1013904223U;
            s = static_cast<std::int16_t>((static_cast<double>(noise >> 16) - 32768.0) / 32768.0 *
                                          gain);
        }
        wave.write(reinterpret_cast<const char*>(block.data()), 9600);
    }
    std::ofstream level(dir + "/data.000/20240305_12.csv", std::ios::binary);
    level << "Session Name,,Hour\r\nLogger Serial Number,,4711\r\nDate,,05/03/2024\r\n"
             "Hour,,12\r\nTemperature,, 12.5\r\n"
             "Time,SPL-A,SPL-C,LEQ-A,LEQ-C,Signal Condition,Battery\r\n";
    for (std::size_t slot = 1; slot <= periods && slot < 36000; ++slot) {
        level << slot / 600 << ':' << slot / 10 % 60 << '.' << slot % 10
              << ",50.0,60.0,50.0,60.0,0,12.6\r\n";
    }
    if (periods == 36000) {  // the record 13:00:00.0 closes the hour
        std::ofstream(dir + "/data.000/20240305_13.csv", std::ios::binary)
            << "Session Name,,Hour\r\nLogger Serial Number,,4711\r\nDate,,05/03/2024\r\n"
               "Hour,,13\r\nTemperature,, 12.5\r\n"
               "Time,SPL-A,SPL-C,LEQ-A,LEQ-C,Signal Condition,Battery\r\n"
               "0:0.0,50.0,60.0,50.0,60.0,0,12.6\r\n";
    }
    return dir;
}

double seconds(Clock::time_point since) {
    return std::chrono::duration<double>(Clock::now() - since).count();
}

// Gates every record of the level file, dispatching at 15-minute boundaries; the work items
// only read their block's audio in one-minute pieces. With `rawExport`, every block is
// turned into hourly raw levels instead (on this thread, as in a run).
double gateReadDispatch(const std::string& sessionDir, bool rawExport) {
    orv::SessionRecord session;
    session.sessionPath = sessionDir + "/";
    session.waveFiles = {"data.000/20240305_120000.wav"};
    std::vector<char> bytes;
    platform::readRegularFile(sessionDir + "/data.000/20240305_12.csv", bytes, ~0ULL);
    orv::DataFileHeader header;
    std::size_t first = 0;
    orv::LevelRecordQueue records;
    orv::parseDataFileHeader(bytes.data(), bytes.size(), header, first);
    orv::decodeLevelRecords(bytes.data() + first, bytes.size() - first, records);

    std::string printed;
    platform::Console console(&printed);
    platform::ThreadPool pool(2);
    orv::SessionAudio::Options options;
    options.dispatch.workerLimit = 2;
    options.preRollSeconds = 3;
    std::set<std::string> written;
    orv::RunResults run(console);
    orv::HourlyRawFiles files(sessionDir + "/", written, run);
    orv::RawLevelExport exporter(10.0F, 1.0F, files, console);
    const auto start = Clock::now();
    {
        orv::AudioDispatcher::Analysis readOnly = [](orv::AudioBlock& b) {
            std::vector<std::int16_t> piece(2880000);
            for (std::uint64_t at = 0; at < b.sampleCount(); at += piece.size()) {
                const auto n = static_cast<std::size_t>(
                    std::min<std::uint64_t>(piece.size(), b.sampleCount() - at));
                if (!b.audio.read(at, n, piece.data())) std::abort();
            }
        };
        orv::SessionAudio audio(session, pool, rawExport ? nullptr : readOnly,
                                rawExport ? &exporter : nullptr, options, console);
        for (const orv::LevelRecord& r : records.records) {
            audio.step(r, header, r.tenth == 0 && r.second == 0 && r.minute % 15 == 0);
        }
        // The last record closes the hour's last interval.
        orv::LevelRecord last = records.records.back();
        last.minute = 0;
        last.second = 0;
        last.tenth = 0;
        audio.step(last, header, true);
        audio.finish();
        exporter.finish();
    }
    return seconds(start);
}

double readOnce(const std::string& path) {
    const auto start = Clock::now();
    std::vector<char> bytes;
    if (platform::readRegularFile(path, bytes, ~0ULL) != platform::ReadResult::Ok) std::abort();
    return seconds(start);
}

struct RunFigures {
    double seconds = 0;
    long peakKiB = 0;
};

// One run of the tool in a child process.
RunFigures runTool(const std::string& root, const std::vector<std::string>& options,
                   unsigned workerThreads) {
    const auto start = Clock::now();
    std::fflush(stdout);
    const pid_t pid = ::fork();
    if (pid == 0) {
        std::vector<std::string> args{"orv_cmd", "-s", root + "/sessions", "-d", root + "/out"};
        args.insert(args.end(), options.begin(), options.end());
        std::vector<const char*> argv;
        for (const std::string& a : args) argv.push_back(a.c_str());
        std::string printed;
        platform::Console console(&printed);
        orv::RunEnvironment env;
        env.audio.workerThreads = workerThreads;
        if (workerThreads == 1) env.audio.workerLimit = 1;
        ::_exit(orv::runOrvCmd(static_cast<int>(argv.size()), argv.data(), console, env));
    }
    int status = 0;
    struct rusage usage {};
    ::wait4(pid, &status, 0, &usage);
    return RunFigures{seconds(start), usage.ru_maxrss};
}

}  // namespace

int main(int argc, char** argv) {
    const unsigned minutes = argc > 1 ? static_cast<unsigned>(std::atoi(argv[1])) : 60;
    std::string root = (fs::temp_directory_path() / "orv_audio_bench_XXXXXX").string();
    if (::mkdtemp(root.data()) == nullptr) return 1;
    const std::string dir = writeSession(root, minutes);
    const std::string wave = dir + "/data.000/20240305_120000.wav";
    const double mb = static_cast<double>(fs::file_size(wave)) / 1e6;
    const double audioSeconds = minutes * 60.0;

    readOnce(wave);  // into the page cache, as every figure below reads from it
    const double read = readOnce(wave);
    const double gate = gateReadDispatch(dir, false);
    const double raw = gateReadDispatch(dir, true);
    std::printf("%.1f MB of audio (%u min)\n", mb, minutes);
    std::printf("one read of the file:              %8.0f MB/s\n", mb / read);
    std::printf("gate, dispatch, read in 1 min:     %8.0f MB/s  (%.2fx the single read's time)\n",
                mb / gate, gate / read);
    std::printf("hourly raw levels (-csv):          %8.0f records/s, %.0fx real time\n",
                audioSeconds * 10.0 / raw, audioSeconds / raw);

    const std::vector<std::string> bands{"-oct", "3", "Z", "F", "-bpf", "500", "2000", "A", "F"};
    std::printf("\nwhole run, -oct 3 Z F -bpf 500 2000 A F:\n");
    for (const char* interval : {"15", "60"}) {
        for (unsigned threads : {0U, 1U}) {
            std::vector<std::string> options = bands;
            options.insert(options.end(), {"-i", interval});
            const RunFigures f = runTool(root, options, threads);
            std::printf("  -i %-2s %-17s %6.2f s  %6.0fx real time  peak %5.0f MiB\n", interval,
                        threads == 0 ? "default workers" : "1 worker", f.seconds,
                        audioSeconds / f.seconds, static_cast<double>(f.peakKiB) / 1024.0);
        }
    }
    fs::remove_all(root);
    return 0;
}
