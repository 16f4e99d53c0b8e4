#include "processing/session_driver.h"

namespace orv {

void SessionProcessor::processSession(SessionRecord& /*session*/, ProgressPipe& /*pipe*/) {}

}  // namespace orv
