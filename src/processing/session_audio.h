// The audio side of one session run: every level record's 100 ms of audio is gated
// (WaveCursor), gathered into the block being filled, and the block is dispatched to the
// analysis at each statistics boundary and when a triggered recording ends.
#pragma once

#include <cstdint>
#include <memory>

#include "input/wave_cursor.h"
#include "processing/audio_block.h"
#include "processing/audio_dispatcher.h"

namespace orv {

// Sees every block on the driver's thread before it is queued, in dispatch order.
class BlockObserver {
public:
    virtual ~BlockObserver() = default;
    virtual void onDispatch(const AudioBlock& block) = 0;
};

class SessionAudio {
public:
    struct Options {
        AudioDispatcher::Options dispatch;
        // Seconds of a recording kept as pre-roll for the block that starts after them.
        unsigned preRollSeconds = 0;
    };

    SessionAudio(const SessionRecord& session, platform::ThreadPool& pool,
                 AudioDispatcher::Analysis analysis, BlockObserver* observer,
                 const Options& options, platform::Console& out);

    // One record: gates its audio into the current block; `atBoundary`: the record closed a
    // statistics interval whose audio is to be dispatched.
    void step(const LevelRecord& r, const DataFileHeader& header, bool atBoundary);
    // End of the session: the partly filled last block is dropped (its interval has not
    // ended) and every dispatched block is waited for.
    void finish();

    const WaveCursor& cursor() const { return cursor_; }
    const AudioDispatcher& dispatcher() const { return dispatcher_; }

private:
    void dispatchBlock(const DataFileHeader& header);

    WaveCursor cursor_;
    AudioDispatcher dispatcher_;
    BlockObserver* observer_;
    std::unique_ptr<AudioBlock> block_;
    AudioSpans period_;  // reused for every record
};

}  // namespace orv
