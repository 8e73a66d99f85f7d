#ifndef QNEDIT_MUXER_OUTPUT_H
#define QNEDIT_MUXER_OUTPUT_H

#include "OutputFile.h"
#include "QNMediaMuxer.h"

namespace qnedit {

// Stops the muxer, releases it (the writer lets go of the descriptor) and
// keeps the output, or removes it and reports why it could not be completed.
void finishOutput(android::sp<android::qnmediaeditor::QNMediaMuxer>& muxer, OutputFile& out);

}  // namespace qnedit

#endif
