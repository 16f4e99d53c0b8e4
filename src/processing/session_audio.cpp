#include "processing/session_audio.h"

namespace orv {

SessionAudio::SessionAudio(const SessionRecord& session, platform::ThreadPool& pool,
                           AudioDispatcher::Analysis analysis, BlockObserver* observer,
                           const Options& options, platform::Console& out)
    : cursor_(session, std::size_t{options.preRollSeconds} * 10, out),
      dispatcher_(pool, std::move(analysis), options.dispatch),
      observer_(observer),
      block_(std::make_unique<AudioBlock>()) {
    if (session.waveFileCount() == 0) {
        out.print("ERR: No wave files in %s - no results from audio for this session\r\n",
                  session.sessionPath.c_str());
    }
}

void SessionAudio::step(const LevelRecord& r, const DataFileHeader& header, bool atBoundary) {
    const WaveCursor::Decision d = cursor_.gate(r, header, period_);
    // A recording that starts right after the previous one starts the next block; a
    // record outside the range is the last one offered to the block it ends.
    if (d.endsBlock && d.accepted) dispatchBlock(header);
    block_->stamp(r, header);
    if (d.accepted) {
        if (block_->periodCount() == 0) {
            block_->continuesRecording = d.continuesRecording;
            cursor_.precedingAudio(block_->preRoll, block_->preRollMarks);
        }
        block_->add(r, header, period_);
    }
    if ((d.endsBlock && !d.accepted) || atBoundary) dispatchBlock(header);
}

void SessionAudio::dispatchBlock(const DataFileHeader& header) {
    // A block without audio is not dispatched; it stays the one being filled.
    if (block_->periodCount() == 0) return;
    block_->temperature = header.temperature;
    if (observer_ != nullptr) observer_->onDispatch(*block_);
    dispatcher_.dispatch(std::move(block_));
    block_ = std::make_unique<AudioBlock>();
}

void SessionAudio::finish() {
    block_ = std::make_unique<AudioBlock>();
    dispatcher_.waitForAll();
}

}  // namespace orv
