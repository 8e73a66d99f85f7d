#include "MuxerOutput.h"

#include "Cli.h"
#include "Input.h"

namespace qnedit {

void finishOutput(android::sp<android::qnmediaeditor::QNMediaMuxer>& muxer, OutputFile& out) {
    const android::status_t err = muxer->stop();
    muxer.clear();
    if (err != android::OK) inputError(out.path() + ": write failed (" + describeWriteStatus(err) + ")");
    out.commit();
}

}  // namespace qnedit
