#include "processing/session_driver.h"

#include "input/input_file.h"
#include "platform/directory.h"
#include "processing/record_statistics.h"
#include "results/general_results.h"
#include "results/leq_results.h"
#include "results/result_files.h"
#include "tweight.h"

namespace orv {

std::uint32_t SessionProcessor::generalTimeWeighting(const SessionRecord& session) {
    return session.timeWeightingMs == 125 ? SlmLibrary::TWeight::F : SlmLibrary::TWeight::S;
}

ResultHeaderInfo SessionProcessor::headerInfo(const SessionRecord& session,
                                              const DataFileHeader& header) const {
    ResultHeaderInfo info;
    info.serialNumber = header.serialNumber.substr(0, ResultHeaderInfo::kMaxSerialNumber);
    info.title = header.sessionTitle.substr(0, ResultHeaderInfo::kMaxTitle);
    info.generalWeighting = settings_.generalWeighting;
    info.octaveFreqWeighting = settings_.octaveFreqWeighting;
    info.statsIntervalMin = settings_.statsIntervalMin;
    info.leqInterval = settings_.leqInterval;
    info.timeWeightingMs = session.timeWeightingMs;
    info.octaveTimeWeighting = settings_.octaveTimeWeighting;
    info.sessionStart = session.sessionStart;
    info.sessionEnd = session.sessionEnd;
    info.percentiles = settings_.percentiles;
    return info;
}

void SessionProcessor::processSession(const SessionRecord& session, ProgressPipe& pipe) {
    const std::uint32_t timeWeighting = generalTimeWeighting(session);
    const ResultNaming naming(settings_, results_.sessionFileName(session), timeWeighting);
    GeneralResultsWriter general(results_);
    LeqResultsWriter leq(results_);

    // Result files. Without its general results file a session is skipped; a Leq file
    // that cannot be created switches short-Leq results off for the rest of the run.
    naming.prepareSessionDirectory();
    if (!general.open(naming.general())) return;
    if (!platform::isDirectory(session.sessionPath)) return;
    if (settings_.leqOn() && !leq.open(LeqFileKind::AllPass, naming.leq(LeqFileKind::AllPass, 0))) {
        settings_.leqInterval = ProcessingSettings::kLeqOff;
    }
    const bool leqOn = settings_.leqOn();
    // The files of the audio results (octave band files, octave Leq file, filtered channel
    // file) are created here, next to the general and Leq files, once the audio analysis
    // exists; until then -oct, the filter options and -csv produce no files.

    RecordStatistics statistics(settings_, session.triggerOn != 0, general, leqOn ? &leq : nullptr);
    bool headersWritten = false;
    const std::uint32_t fileCount = session.dataFileCount();
    for (std::uint32_t i = 0; i < fileCount; ++i) {
        const std::string path = session.sessionPath + session.dataFiles[i];
        DataFileHeader header;
        if (loadLevelDataFile(path, fileBytes_, header, records_, out_) == LevelFileLoad::Skipped) {
            continue;  // skipped without progress
        }

        if (!headersWritten) {
            headersWritten = true;
            const ResultHeaderInfo info = headerInfo(session, header);
            if (general.writeHeader(info, timeWeighting) && leqOn) {
                if (leq.formatHeader(LeqFileKind::AllPass, info, 1)) {
                    leq.writeColumnHeader(LeqFileKind::AllPass);
                }
            }
        }

        for (const LevelRecord& r : records_.records) {
            statistics.sequenceCheck(r, header);
            if (leqOn) statistics.stepShortLeq(r, header);
            if (!statistics.stepGeneralStatistics(r, header)) break;  // rest of the file skipped
            // Audio branch: the record's 100 ms of audio is gated into the current block, which
            // is dispatched to the analysis workers when the statistics ask for it.
            statistics.takeDispatchRequest();
        }

        const float percent = static_cast<float>(i + 1) / static_cast<float>(fileCount) * 100.0F;
        if (settings_.binMode != 0) {
            pipe.sendProgress(percent);
            out_.print("%s Complete\r\n", session.dataFiles[i].c_str());
        } else {
            out_.print("%.1f %% Complete\r\n", static_cast<double>(percent));
        }
    }

    out_.print("\r\n");
    // The audio analysis waits here for the session's workers and writes what they left.
    statistics.finishSession();
    general.close();
    leq.close(LeqFileKind::AllPass);
}

}  // namespace orv
