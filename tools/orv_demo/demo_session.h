// Generator of a demo session: a session directory as the logger writes it, with an
// information file, hourly level data files and WAV recordings of one synthetic sound
// scene. The level files' 100 ms levels are measured on the very audio the WAV files
// hold (where audio is recorded), so results computed from either agree.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "civil_time.h"

namespace orv_demo {

struct DemoOptions {
    std::string outDir = "demo-session";
    std::string name = "Demo";
    CivilTime start{2024, 3, 5, 12, 58, 0};
    std::int64_t durationSeconds = 240;
    double calibration = 20.0;  // dB; written with two decimals
    std::uint64_t seed = 1;
    bool triggered = false;
    int preRecordSeconds = -1;      // -1: 5 s for triggered sessions, 0 otherwise
    std::int64_t splitSeconds = 0;  // length of the parts of a split recording; 0: no split
    std::int64_t waveMinutes = -1;  // untriggered: minutes of audio from the start; -1: all
    bool audio = true;              // false: level files only
};

// Part of a recording: one wave file and the 100 ms records its audio belongs to.
struct WavePart {
    std::string name;
    std::int64_t firstRecord = 0;  // record index from the session start
    std::int64_t recordCount = 0;
};

// One recording, possibly split over several wave files.
struct Recording {
    std::int64_t firstRecord = 0, endRecord = 0;  // records [first, end) have its audio
    std::vector<WavePart> parts;
};

struct SessionPlan {
    std::string sessionDir;  // outDir/name
    std::int64_t startSeconds = 0;
    std::int64_t recordCount = 0;
    unsigned preRecordSeconds = 0;
    std::string calibrationText;
    std::vector<Recording> recordings;  // in time order, not overlapping
};

struct DemoSummary {
    SessionPlan plan;
    std::vector<std::string> levelFiles;  // names in data.000
    std::size_t passBys = 0;
    std::int64_t overloadedRecords = 0;
    std::int64_t audioSeconds = 0;
};

// Checks the options; an empty text means they can be used.
std::string checkOptions(const DemoOptions& options);

// Writes the session; replaces the information, level and wave files of an earlier session
// of the same directory. Throws std::runtime_error when a file cannot be written or the
// options do not describe a session that can be written.
DemoSummary generateDemoSession(const DemoOptions& options);

}  // namespace orv_demo
