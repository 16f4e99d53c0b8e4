#include "analysis/block_worker.h"

#include <new>
#include <thread>

namespace orv {

void BlockWorker::operator()(const AudioBlock& block) const {
    BlockResult result;
    std::string error;
    BlockFailure failure = BlockFailure::None;
    try {
        failure = analyseBlock(block, settings_, result, error);
    } catch (const std::bad_alloc&) {
        failure = BlockFailure::SetUp;
        result = BlockResult{};
    }
    if (failure == BlockFailure::SetUp) {
        if (!error.empty() && !runState_.filterErrorShown.exchange(true)) {
            out_.print("\r\nUnable to configure filters - %s\r\n", error.c_str());
            std::this_thread::sleep_for(runState_.filterErrorPause);
        }
        out_.print("Error Allocating Memory\r\n");
    } else if (failure == BlockFailure::Read) {
        out_.print("ERR: Unable to read %s\r\n", error.c_str());
    }
    pending_.enter(block.sequence, std::move(result));
}

}  // namespace orv
