#include "demo_options.h"

#include <charconv>
#include <cmath>
#include <cstdlib>

namespace orv_demo {
namespace {

template <typename T>
bool parseWhole(const std::string& text, T& out) {
    const char* end = text.data() + text.size();
    const auto [ptr, ec] = std::from_chars(text.data(), end, out);
    return !text.empty() && ec == std::errc() && ptr == end;
}

bool parseDecimal(const std::string& text, double& out) {
    if (text.empty() || text.find_first_not_of("0123456789.-") != std::string::npos) return false;
    char* end = nullptr;
    out = std::strtod(text.c_str(), &end);
    return end == text.c_str() + text.size() && std::isfinite(out);
}

}  // namespace

std::string usageText() {
    return "usage: orv_demo [options]\n"
           "Writes a demo logger session DIR/NAME with an information file, hourly level files\n"
           "and 48 kHz WAV audio of a synthetic roadside scene.\n"
           "  --out DIR             parent directory of the session (default demo-session)\n"
           "  --name NAME           session name and directory name (default Demo)\n"
           "  --start \"YYYY-MM-DD HH:MM:SS\"   session start (default 2024-03-05 12:58:00)\n"
           "  --duration SECONDS    session length (default 240)\n"
           "  --calibration DB      calibration of the recording, 0 to 99.99 (default 20.00)\n"
           "  --seed N              seed of the scene and its noise (default 1)\n"
           "  --triggered           triggered session: one recording per vehicle pass-by\n"
           "  --pre-record SECONDS  pre-record length (default 5 when triggered, else 0)\n"
           "  --split-wave SECONDS  split each recording into wave files of this length\n"
           "  --wave-minutes N      untriggered: record audio for the first N minutes only\n"
           "  --no-audio            level files only (levels from a model of the scene)\n"
           "  --help                this text\n";
}

ParsedCommandLine parseCommandLine(const std::vector<std::string>& args) {
    ParsedCommandLine r;
    DemoOptions& o = r.options;
    for (std::size_t i = 0; i < args.size() && r.error.empty(); ++i) {
        const std::string& a = args[i];
        if (a == "--help" || a == "-h") {
            r.help = true;
            continue;
        }
        if (a == "--triggered") {
            o.triggered = true;
            continue;
        }
        if (a == "--no-audio") {
            o.audio = false;
            continue;
        }
        if (i + 1 >= args.size()) {
            r.error = a.rfind("--", 0) == 0 ? a + " needs a value" : "unknown argument " + a;
            break;
        }
        const std::string& v = args[++i];
        bool ok = true;
        if (a == "--out") {
            o.outDir = v;
            ok = !v.empty();
        } else if (a == "--name") {
            o.name = v;
        } else if (a == "--start") {
            const auto t = parseCivilTime(v);
            ok = t.has_value();
            if (ok) o.start = *t;
        } else if (a == "--duration") {
            ok = parseWhole(v, o.durationSeconds);
        } else if (a == "--calibration") {
            ok = parseDecimal(v, o.calibration);
        } else if (a == "--seed") {
            ok = parseWhole(v, o.seed);
        } else if (a == "--pre-record") {
            ok = parseWhole(v, o.preRecordSeconds) && o.preRecordSeconds >= 0;
        } else if (a == "--split-wave") {
            ok = parseWhole(v, o.splitSeconds) && o.splitSeconds > 0;
        } else if (a == "--wave-minutes") {
            ok = parseWhole(v, o.waveMinutes) && o.waveMinutes >= 0;
        } else {
            r.error = "unknown option " + a;
            break;
        }
        if (!ok) r.error = "bad value for " + a + ": '" + v + "'";
    }
    if (r.error.empty() && !r.help) r.error = checkOptions(o);
    return r;
}

}  // namespace orv_demo
