#include "processing/session_driver.h"

#include <optional>

#include "analysis/raw_export.h"
#include "input/input_file.h"
#include "platform/directory.h"
#include "platform/system_info.h"
#include "processing/record_statistics.h"
#include "processing/session_audio.h"
#include "results/session_result_files.h"
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

platform::ThreadPool& SessionProcessor::pool() {
    if (!pool_) {
        const unsigned threads = audioOptions_.workerThreads != 0
                                     ? audioOptions_.workerThreads
                                     : platform::logicalProcessorCount();
        pool_ = std::make_unique<platform::ThreadPool>(threads);
    }
    return *pool_;
}

unsigned SessionProcessor::workerLimit() const {
    if (audioOptions_.workerLimit != 0) return audioOptions_.workerLimit;
    // An hour-long block is a whole hour of analysis: one at a time.
    if (settings_.statsIntervalMin == 0) return 1;
    return countWorkerThreads(platform::physicalCoreCount(), platform::logicalProcessorCount());
}

void SessionProcessor::processSession(const SessionRecord& session, ProgressPipe& pipe) {
    const std::uint32_t timeWeighting = generalTimeWeighting(session);
    SessionResultFiles files(settings_, results_.sessionFileName(session), timeWeighting, results_);
    // Without its general results file a session is skipped.
    if (!files.create()) return;
    if (!platform::isDirectory(session.sessionPath)) return;
    const bool leqOn = settings_.leqOn();
    RecordStatistics statistics(settings_, session.triggerOn != 0, files.general,
                                leqOn ? &files.leq : nullptr);

    // The audio: band and filtered-channel analysis on the workers.
    const BandAnalysisSettings analysis = BandAnalysisSettings::from(settings_, session);
    const bool analyseBands = analysis.bandCount != 0 || analysis.auxFilterType != 0;
    PendingIntervalMap pending(files.bands, leqOn ? &files.leq : nullptr);
    const BlockWorker worker(analysis, pending, analysisState_, out_);
    // The hourly raw levels, from every block before it is queued.
    HourlyRawFiles rawFiles(files.naming().directory(), analysisState_.rawFilesWritten, results_);
    std::optional<RawLevelExport> rawExport;
    if (settings_.rawLevelCsv != 0) {
        rawExport.emplace(analysis.calibrationGain, analysis.rangeMultiplier, rawFiles, out_);
    }
    std::optional<SessionAudio> audio;
    if (analyseBands || settings_.rawLevelCsv != 0) {
        SessionAudio::Options options;
        options.dispatch.workerLimit = workerLimit();
        options.dispatch.residentBytes = platform::residentBytes;
        options.dispatch.reverseOrder = audioOptions_.reverseBlockOrder;
        options.preRollSeconds = analyseBands ? analysis.preRollSeconds() : 0;
        AudioDispatcher::Analysis analyse;
        if (analyseBands) analyse = [&worker](AudioBlock& block) { worker(block); };
        audio.emplace(session, pool(), std::move(analyse), rawExport ? &*rawExport : nullptr,
                      options, out_);
    }

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
            files.writeHeaders(headerInfo(session, header));
        }

        for (const LevelRecord& r : records_.records) {
            statistics.sequenceCheck(r, header);
            if (leqOn) statistics.stepShortLeq(r, header);
            if (!statistics.stepGeneralStatistics(r, header)) break;  // rest of the file skipped
            const bool boundary = statistics.takeDispatchRequest();
            if (audio) audio->step(r, header, boundary);
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
    statistics.finishSession();
    // Nothing of the session outlives it: its blocks are analysed and written before its
    // files are closed.
    if (audio) audio->finish();
    if (rawExport) rawExport->finish();
    pending.flushAll();
    files.close();
}

}  // namespace orv
