#include "results/session_result_files.h"

namespace orv {

SessionResultFiles::SessionResultFiles(ProcessingSettings& settings, std::string sessionFileName,
                                       std::uint32_t generalTimeWeighting, RunResults& run)
    : general(run),
      leq(run),
      bands(run),
      settings_(settings),
      naming_(settings, std::move(sessionFileName), generalTimeWeighting),
      generalTimeWeighting_(generalTimeWeighting) {}

bool SessionResultFiles::create() {
    naming_.prepareSessionDirectory();
    if (!general.open(naming_.general())) return false;
    ProcessingSettings& s = settings_;
    if (s.leqOn()) {
        const bool opened =
            leq.open(LeqFileKind::AllPass, naming_.leq(LeqFileKind::AllPass, 0)) &&
            (s.octaveBandCount == 0 ||
             leq.open(LeqFileKind::Octave, naming_.leq(LeqFileKind::Octave, s.octaveBandCount)));
        if (!opened) s.leqInterval = ProcessingSettings::kLeqOff;
    }
    if (s.octaveBandCount != 0 && !bands.openBandFiles(naming_, s.octaveBandCount)) {
        s.octaveBandCount = 0;
    }
    if (s.auxFilterType != 0 && !bands.openFilteredFile(naming_.filtered(), s.auxFilterType)) {
        s.auxFilterType = 0;
    }
    return true;
}

void SessionResultFiles::writeHeaders(const ResultHeaderInfo& info) {
    const ProcessingSettings& s = settings_;
    if (!general.writeHeader(info, generalTimeWeighting_)) return;
    if (s.leqOn()) {
        if (!leq.formatHeader(LeqFileKind::AllPass, info, 1) ||
            !leq.writeColumnHeader(LeqFileKind::AllPass)) {
            return;
        }
        if (s.octaveBandCount != 0) {
            const std::string filterColumn =
                s.auxFilterType != 0 ? filterName(s.auxFilterType) : "";
            if (!leq.formatHeader(LeqFileKind::Octave, info, s.octaveBandCount, filterColumn) ||
                !leq.writeColumnHeader(LeqFileKind::Octave)) {
                return;
            }
        }
    }
    if (s.octaveBandCount != 0 &&
        !bands.writeBandHeaders(info, s.octaveFreqWeighting, s.octaveTimeWeighting)) {
        return;
    }
    if (s.auxFilterType != 0)
        bands.writeFilteredHeader(info, s.auxFreqWeighting, s.auxTimeWeighting);
}

void SessionResultFiles::close() {
    general.close();
    leq.close(LeqFileKind::AllPass);
    leq.close(LeqFileKind::Octave);
    bands.close();
}

}  // namespace orv
