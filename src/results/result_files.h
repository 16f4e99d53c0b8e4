// Names of a session's result files in the two layouts, and their creation.
#pragma once

#include <atomic>
#include <cstdint>
#include <string>
#include <string_view>
#include <unordered_set>

#include "config/processing_settings.h"
#include "platform/console.h"
#include "platform/files.h"
#include "sessions/session_record.h"

namespace orv {

enum class LeqFileKind { AllPass = 0, Octave = 1 };

// "ERR", "LPF", "HPF", "BPF", "BSF", "IIR", "APF" by filter type.
const char* filterName(std::uint32_t type);
// "3OCT" for 36 bands, else "1OCT".
const char* octaveLabel(std::uint32_t bandCount);

// The run's bookkeeping of its result files, one per run (kept in the run's state): where
// their messages go, whether any result was lost, and the names the sessions' files carry.
class RunResults {
public:
    explicit RunResults(platform::Console& console) : out(console) {}
    RunResults(const RunResults&) = delete;
    RunResults& operator=(const RunResults&) = delete;

    platform::Console& out;

    // Any thread: a result file could not be created or written in full.
    void markLost() { lost_.store(true, std::memory_order_relaxed); }
    bool lost() const { return lost_.load(std::memory_order_relaxed); }

    // The name the session's result files carry (driver thread). The session name with '/',
    // '\\', control characters and a leading '.' replaced by '_', so that no result path leaves
    // the output directory; an empty name becomes the session directory's name. A name that
    // an earlier session of the run already carries gets "_2", "_3", ... Each change is
    // reported on the console.
    std::string sessionFileName(const SessionRecord& session);

private:
    std::atomic<bool> lost_{false};
    std::unordered_set<std::string> taken_;
};

// One result file. Every result writer writes through it, so that each failure is reported
// the same way: a file that cannot be created prints "Unable to open %s : %u"; the first
// failed or short write (or close) of a file prints "ERR: Unable to write %s : <reason>".
// Either marks the run's results as lost. Not locked: a file shared between threads is
// guarded by its writer.
class ResultFile {
public:
    ResultFile() = default;
    ResultFile(ResultFile&&) = default;  // the moved-from file is closed
    ResultFile& operator=(ResultFile&& other);
    ~ResultFile() { close(); }

    // Creates the file anew (replacing and truncating an old one). False on failure.
    bool create(const std::string& path, RunResults& run);
    // Writes all bytes. False, when the file is not open or the write failed or fell short.
    bool write(std::string_view text);
    void close();

    bool isOpen() const { return file_.valid(); }
    const std::string& path() const { return path_; }

private:
    void reportWriteFailure(int error);

    platform::File file_;
    std::string path_;
    RunResults* run_ = nullptr;
    bool reported_ = false;
};

// Builds the result file names of one session. In the flat layout every file lies in the
// output directory with the session name as prefix; in the sub-directory layout (-bin) the
// files lie in <output>/<session name>/ with names that spell out weightings and intervals.
class ResultNaming {
public:
    // The longest path a result file may have.
    static constexpr std::size_t kMaxPathLength = 259;

    // `sessionFileName` as RunResults::sessionFileName gives it.
    ResultNaming(const ProcessingSettings& settings, std::string sessionFileName,
                 std::uint32_t generalTimeWeighting)
        : settings_(settings),
          name_(std::move(sessionFileName)),
          generalTimeWeighting_(generalTimeWeighting) {}

    std::string general() const;
    std::string leq(LeqFileKind kind, std::uint32_t octaveBandCount) const;
    std::string octaveBand(std::uint32_t band, std::uint32_t bandCount) const;
    std::string filtered() const;
    // The name of roll-over part `part` (> 0) of a Leq file: ".csv" replaced by "_<part>.csv".
    static std::string leqPart(const std::string& name, std::uint32_t part);

    // The per-session directory of the sub-directory layout, created when missing (errors
    // are left to the file creation that follows). Empty in the flat layout.
    std::string prepareSessionDirectory() const;
    // Where the session's files go: the output directory (flat) or the session directory,
    // ending with the path separator.
    std::string directory() const;

private:
    const ProcessingSettings& settings_;
    const std::string name_;
    std::uint32_t generalTimeWeighting_;
};

}  // namespace orv
