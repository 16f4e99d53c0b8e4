#include "config/command_line.h"

#include <strings.h>

#include <cerrno>
#include <climits>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <new>
#include <string>
#include <vector>

#include "config/settings.h"
#include "fweight.h"
#include "platform/directory.h"
#include "platform/path.h"
#include "sessions/search_paths.h"
#include "tweight.h"

namespace orv {
namespace {

constexpr const char* kUsage[] = {
    "\r\nQuellmark\r\n",
    "Orvane - Telwa Session Post Processing Command Line Tool\r\n\r\n",
    nullptr,  // "Version :  V%.2f\r\n\r\n", printed with the version number
    "USAGE   :  orv_cmd [options] -s <session dir> -d <output dir>\r\n\r\n",
    "OPTIONS : -h               This help message\r\n",
    "\r\n",
    "-----  Common Statistics Options -------\r\n",
    "          -p <n1 n2 n3...> List of required space separated percentiles\r\n",
    "                           If not set the following default values are used\r\n",
    "                           1 5 10 25 50 75 90 99\r\n\r\n",
    "          -i <n>           Statistics interval in minutes\r\n",
    "                           <1, 2, 3, 4, 5, 10, 15, 20, 30 or 60>\r\n",
    "                           If not set, defaults to 15min\r\n",
    "                           Note - Length of interval for triggered PCM data is\r\n",
    "                           determined by the length of each PCM file\r\n",
    "\r\n",
    "-----  General Statistics Specific Options -------\r\n",
    "          -w <A/C>         General Statistics Frequency Weighting (A or C)\r\n",
    "                           If not set, defaults to A\r\n\r\n",
    "          -leq <n>         Enable Equivalent level calculation\r\n",
    "                           n - calculation interval in seconds\r\n",
    "                           <1, 2, 4, 10, 20, 30, 60>\r\n",
    "\r\n",
    "-----  Octave Band Statistics Specific Options -------\r\n",
    "          -oct <1 or 3> <A/C/Z> <F/S/N>\r\n",
    "                           Enable octave band analysis\r\n",
    "                           1 or 3 - 1/1 or 1/3 Octaves\r\n",
    "                           A/C/Z  - Frequency Weighting (A Default)\r\n",
    "                           F/S/N  - Time Weighting (F Default)\r\n",
    "\r\n",
    "-----  Additional Filtered Output File -------\r\n",
    "        Only one filter type allowed\r\n",
    "        If conflicting options are presented\r\n",
    "        the rightmost conflicting option is used\r\n",
    "        Accepted frequencies are as follows: (in Hz)\r\n",
    "        25, 31, 40, 50, 63, 80, 100, 125, 160, 200,\r\n",
    "        250, 316, 400, 500, 630, 800, 1000, 1250, 1600, 2000,\r\n",
    "        2500, 3160, 4000, 5000, 6300, 8000, 10000, 12500, 16000, 20000\r\n",
    "          -lpf <f1> <A/C> <F/S/N>\r\n",
    "                                Enable Low-Pass Filter\r\n",
    "                                f1    - Filter Cut-off Frequency\r\n",
    "                                A/C   - Frequency Weighting (A Default)\r\n",
    "                                F/S/N - Time Weighting (F Default)\r\n",
    "          -hpf <f1> <A/C> <F/S/N>\r\n",
    "                                Enable High-Pass Filter\r\n",
    "                                f1    - Filter Cut-off Frequency\r\n",
    "                                A/C   - Frequency Weighting (A Default)\r\n",
    "                                F/S/N - Time Weighting (F Default)\r\n",
    "          -bpf <f1 f2> <A/C> <F/S/N>\r\n",
    "                                Enable Band-Pass Filter\r\n",
    "                                f1 f2 - Filter Pass Band\r\n",
    "                                A/C   - Frequency Weighting (A Default)\r\n",
    "                                F/S/N - Time Weighting (F Default)\r\n",
    "          -bsf <f1 f2> <A/C> <F/S/N>\r\n",
    "                                Enable Band-Stop Filter\r\n",
    "                                f1 f2 - Filter Stop Band\r\n",
    "                                A/C   - Frequency Weighting (A Default)\r\n",
    "                                F/S/N - Time Weighting (F Default)\r\n",
    "          -apf <A/C> <F/S/N>\r\n",
    "                                Enable All Pass Results (No Filtering)\r\n",
    "                                A/C   - Frequency Weighting (A Default)\r\n",
    "                                F/S/N - Time Weighting (F Default)\r\n",
    "\r\n",
    "-----  Input and Output Location Specific Options -------\r\n",
    "          -r               Recursively search for sessions on path\r\n\r\n",
    "          -s <s1 s2...>    Space Separated Session locations <s1 s2..>\r\n",
    "                           Must be set\r\n\r\n",
    "          -d <dir>         Output directory <dir>\r\n",
    "                           Must be set\r\n",
    "                           Directory will be created if not found\r\n",
    "                           Output files will be saved to this directory\r\n",
    "                           Filenames created will follow session names\r\n",
    "\r\n",
    "-----  Session Type Handling Options -------\r\n",
    "          -trg <S/C>\r\n",
    "                           Triggered file handling type\r\n",
    "                           S - Split - Statistics Results Given on Interval Time AND "
    "End-Of-File\r\n",
    "                           C - Continual - Statistics Results given on End-Of-File only\r\n",
    "                           Defaults to Split type handling\r\n",
    "\r\n",
};

// The longest absolute output directory, without the separator added after it.
constexpr std::size_t kMaxOutputDirLength = 258;

bool startsWithDash(const char* s) { return s[0] == '-'; }

// A whole number read from the start of `text` (strtol, base 10): true when at least one
// character was converted.
bool readWholeNumber(const char* text, long& value) {
    char* end = nullptr;
    errno = 0;
    value = std::strtol(text, &end, 10);
    return end != text;
}

class Parser {
public:
    Parser(int argc, const char* const* argv, ProcessingSettings& s, SearchPathList& paths,
           platform::Console& out)
        : argc_(argc), argv_(argv), s_(s), paths_(paths), out_(out) {}

    int run();

private:
    // The argument at `i`, or nullptr past the end.
    const char* arg(int i) const { return i < argc_ ? argv_[i] : nullptr; }
    // The argument at `i`, or "" past the end (for messages about a missing value).
    const char* text(int i) const { return i < argc_ ? argv_[i] : ""; }

    void searchPaths();
    void percentiles();
    void interval(bool leq);
    void weighting();
    void outputDirectory();
    void octave();
    void filter(AuxFilterType type);
    void triggered();
    bool resolveOutputDirectory(const char* dir);

    int argc_;
    const char* const* argv_;
    ProcessingSettings& s_;
    SearchPathList& paths_;
    platform::Console& out_;
    int pos_ = 1;
    bool ok_ = true;
    unsigned given_ = 0;  // bit 0: search path, bit 1: output directory
};

int Parser::run() {
    if (argc_ < 5) return 0;
    for (;;) {
        while (pos_ < argc_ && !startsWithDash(argv_[pos_])) ++pos_;
        if (pos_ >= argc_) break;
        if (!ok_) return 0;
        const char* word = argv_[pos_];
        const std::size_t len = std::strlen(word);
        if (len != 2 && len != 4) return 0;
        // Each name is compared over its own length, so "-sabc" is "-s".
        auto is = [&](const char* name) {
            return ::strncasecmp(word, name, std::strlen(name)) == 0;
        };
        if (is("-s")) {
            searchPaths();
        } else if (is("-p")) {
            percentiles();
        } else if (is("-i")) {
            interval(false);
        } else if (is("-npn")) {
            if (const char* name = arg(pos_ + 1)) s_.pipeName = name;
            pos_ += 2;
        } else if (is("-bin")) {
            s_.binMode = 1;
            s_.needWaveFiles = 1;
            ++pos_;
        } else if (is("-csv")) {
            s_.rawLevelCsv = 1;
            s_.needWaveFiles = 1;
            ++pos_;
        } else if (is("-w")) {
            weighting();
        } else if (is("-leq")) {
            interval(true);
        } else if (is("-d")) {
            outputDirectory();
        } else if (is("-r")) {
            s_.recursiveSearch = 1;
            ++pos_;
        } else if (is("-oct")) {
            octave();
        } else if (is("-lpf")) {
            filter(AuxFilterType::LowPass);
        } else if (is("-hpf")) {
            filter(AuxFilterType::HighPass);
        } else if (is("-bpf")) {
            filter(AuxFilterType::BandPass);
        } else if (is("-bsf")) {
            filter(AuxFilterType::BandStop);
        } else if (is("-apf")) {
            filter(AuxFilterType::AllPass);
        } else if (is("-trg")) {
            triggered();
        } else {
            return 0;  // unknown option, "-h" included
        }
    }
    return ok_ && given_ == 3 ? 1 : 0;
}

void Parser::searchPaths() {
    for (++pos_; pos_ < argc_ && !startsWithDash(argv_[pos_]); ++pos_) {
        switch (addSearchPath(paths_, argv_[pos_], out_)) {
            case AddPathResult::Added:
            case AddPathResult::Duplicate:
                given_ |= 1;
                break;
            case AddPathResult::Failed:
                ok_ = false;
                break;
        }
    }
}

void Parser::percentiles() {
    int first = ++pos_;
    int end = first;
    while (end < argc_ && !startsWithDash(argv_[end])) ++end;
    bool good = end > first;  // at least one value
    std::vector<float> values;
    try {
        values.reserve(static_cast<std::size_t>(end - first));
        for (pos_ = first; good && pos_ < end; ++pos_) {
            char* stop = nullptr;
            const float v = static_cast<float>(std::strtod(argv_[pos_], &stop));
            // A value must start with a number; not-a-number and infinity are refused.
            good = stop != argv_[pos_] && std::isfinite(v);
            values.push_back(v);
        }
    } catch (const std::bad_alloc&) {
        good = false;
    }
    if (!good) {
        out_.print("ERROR - Unable to set percentiles - Using defaults\r\n");
        return;
    }
    if (configurePercentiles(s_, values.data(), values.size(), out_) == 0) ok_ = false;
}

void Parser::interval(bool leq) {
    const char* value = arg(pos_ + 1);
    pos_ += 2;
    const char* what = leq ? "Leq interval" : "interval";
    long n = 0;
    if (value == nullptr || !readWholeNumber(value, n) || n < 0 ||
        n > static_cast<long>(UINT32_MAX)) {
        out_.print("ERROR - %s is an invalid %s - Using default\r\n", value ? value : "", what);
        return;
    }
    const auto v = static_cast<std::uint32_t>(n);
    const int stored = leq ? setLeqInterval(s_, v, out_) : setStatsInterval(s_, v, out_);
    if (stored == 0) out_.print("ERROR - %u is an invalid %s - Using default\r\n", v, what);
}

void Parser::weighting() {
    const char* value = text(pos_ + 1);
    pos_ += 2;
    if (::strcasecmp(value, "A") == 0) {
        setGeneralWeighting(s_, SlmLibrary::FWeight::A);
    } else if (::strcasecmp(value, "C") == 0) {
        setGeneralWeighting(s_, SlmLibrary::FWeight::C);
    } else {
        out_.print("ERROR - %s is an invalid frequency weighting - Using default\r\n", value);
        setGeneralWeighting(s_, SlmLibrary::FWeight::A);
    }
}

bool Parser::resolveOutputDirectory(const char* dir) {
    if (platform::makeDirectory(dir) == platform::MakeDirResult::Failed) return false;
    // The directory must exist as a directory and be reachable: a file of that name, or a
    // directory that cannot be resolved, would send the results somewhere else.
    std::string absolute;
    if (!platform::canonicalDirectory(dir, absolute)) return false;
    if (absolute.size() > kMaxOutputDirLength) return false;
    if (absolute.back() != platform::kPathSeparator) absolute += platform::kPathSeparator;
    s_.outputDir = absolute;
    return true;
}

void Parser::outputDirectory() {
    if (given_ & 2U) {
        out_.print("ERROR - Multiple output directories given.\r\n");
        ok_ = false;
        ++pos_;
        return;
    }
    const char* dir = arg(pos_ + 1);
    pos_ += 2;
    s_.outputDirValid = 1;
    if (dir == nullptr || dir[0] == '\0' || !resolveOutputDirectory(dir)) {
        s_.outputDirValid = 0;
        out_.print("ERROR - %s is an invalid output directory\r\n", dir ? dir : "");
        ok_ = false;
        return;
    }
    given_ |= 2U;
}

void Parser::octave() {
    const int typePos = ++pos_;
    long type = 0;
    const char* typeText = arg(typePos);
    ++pos_;
    if (typeText == nullptr || !readWholeNumber(typeText, type) || (type != 1 && type != 3)) {
        out_.print("ERROR - %s is an invalid octave type - Disabling Octaves\r\n", text(typePos));
        return;
    }
    std::uint32_t fw = SlmLibrary::FWeight::A;
    std::uint32_t tw = SlmLibrary::TWeight::F;
    const char* fwText = arg(pos_);
    if (fwText == nullptr || startsWithDash(fwText)) return;  // an option word is handled next
    ++pos_;
    if (!parseFreqWeightingLetter(fwText, fw, out_)) return;
    const char* twText = arg(pos_);
    if (twText == nullptr || startsWithDash(twText)) return;
    ++pos_;
    if (!parseTimeWeightingLetter(twText, tw, out_)) return;
    setOctaveBands(s_, static_cast<std::uint32_t>(type), out_);
    setOctaveTimeWeighting(s_, tw, out_);
    setOctaveFreqWeighting(s_, fw, out_);
    s_.needWaveFiles = 1;
}

void Parser::filter(AuxFilterType type) {
    ++pos_;
    const bool twoFrequencies = type == AuxFilterType::BandPass || type == AuxFilterType::BandStop;
    const int frequencyCount = type == AuxFilterType::AllPass ? 0 : (twoFrequencies ? 2 : 1);
    std::uint32_t bands[2] = {0, 0};
    for (int k = 0; k < frequencyCount; ++k) {
        const int at = pos_++;
        const char* value = arg(at);
        long hz = 0;
        bool found = false;
        if (value != nullptr && readWholeNumber(value, hz)) {
            for (std::size_t j = 0; j < kAcceptedFilterFrequencyCount; ++j) {
                if (kAcceptedFilterFrequencies[j] == hz) {
                    bands[k] = static_cast<std::uint32_t>(j);
                    found = true;
                }
            }
        }
        if (!found) {
            out_.print("ERROR - %s is an invalid frequency - Disabling Additional Filtering\r\n",
                       text(at));
            return;
        }
    }
    std::uint32_t fw = SlmLibrary::FWeight::A;
    std::uint32_t tw = SlmLibrary::TWeight::F;
    const char* fwText = arg(pos_);
    if (type == AuxFilterType::AllPass) {
        // Without frequencies a bad letter is reported as a bad value of the filter option.
        const bool dash = fwText == nullptr || startsWithDash(fwText);
        if (!dash) ++pos_;
        if (dash || !parseFreqWeightingLetter(fwText, fw, out_) || fw == SlmLibrary::FWeight::Z) {
            out_.print("ERROR - %s is an invalid frequency - Disabling Additional Filtering\r\n",
                       fwText ? fwText : "");
            return;
        }
    } else {
        if (fwText == nullptr || startsWithDash(fwText)) return;
        ++pos_;
        if (!parseFreqWeightingLetter(fwText, fw, out_)) return;
        if (fw == SlmLibrary::FWeight::Z) return;
    }
    const char* twText = arg(pos_);
    if (twText == nullptr || startsWithDash(twText)) return;
    ++pos_;
    if (!parseTimeWeightingLetter(twText, tw, out_)) return;

    float freqs[2] = {s_.auxFreq1, s_.auxFreq2};
    switch (type) {
        case AuxFilterType::LowPass:
            freqs[0] = bandEdge(bands[0] + 1);
            break;
        case AuxFilterType::HighPass:
            freqs[0] = bandEdge(bands[0]);
            break;
        case AuxFilterType::BandPass:
        case AuxFilterType::BandStop:
            freqs[0] = bandEdge(bands[0]);
            freqs[1] = bandEdge(bands[1] + 1);
            break;
        default:
            break;
    }
    setAuxFilter(s_, static_cast<std::uint32_t>(type), freqs, bands, fw, tw, out_);
    s_.needWaveFiles = 1;
}

void Parser::triggered() {
    ++pos_;  // the value is examined but not consumed: an option word there is handled next
    const char* value = arg(pos_);
    const char c = value != nullptr ? value[0] : '\0';
    if (c == 'C' || c == 'c') {
        s_.triggeredHandling = 1;
    } else if (c == 'S' || c == 's') {
        s_.triggeredHandling = 0;
    } else {
        out_.print(
            "ERROR - %s is an invalid selection for triggered file handling - Using default\r\n",
            value ? value : "");
        s_.triggeredHandling = 0;
    }
}

}  // namespace

int parseFreqWeightingLetter(const char* text, std::uint32_t& code, platform::Console& out) {
    code = SlmLibrary::FWeight::A;
    if (::strcasecmp(text, "A") == 0) return 1;
    if (::strcasecmp(text, "C") == 0) {
        code = SlmLibrary::FWeight::C;
        return 1;
    }
    if (::strcasecmp(text, "Z") == 0) {
        code = SlmLibrary::FWeight::Z;
        return 1;
    }
    out.print("ERROR - %s is an invalid frequency weighting - Using default\r\n", text);
    return 0;
}

int parseTimeWeightingLetter(const char* text, std::uint32_t& code, platform::Console& out) {
    code = SlmLibrary::TWeight::F;
    if (::strcasecmp(text, "F") == 0) return 1;
    if (::strcasecmp(text, "S") == 0) {
        code = SlmLibrary::TWeight::S;
        return 1;
    }
    if (::strcasecmp(text, "N") == 0) {
        code = SlmLibrary::TWeight::N;
        return 1;
    }
    out.print("ERROR - %s is an invalid time weighting - Using default\r\n", text);
    return 0;
}

int parseCommandLine(int argc, const char* const* argv, ProcessingSettings& settings,
                     SearchPathList& paths, platform::Console& out) {
    return Parser(argc, argv, settings, paths, out).run();
}

void printUsage(platform::Console& out) {
    for (std::size_t i = 0; i < std::size(kUsage); ++i) {
        if (kUsage[i] == nullptr) {
            out.print("Version :  V%.2f\r\n\r\n", kToolVersion);
        } else {
            out.write(kUsage[i], std::strlen(kUsage[i]));
        }
    }
}

}  // namespace orv
