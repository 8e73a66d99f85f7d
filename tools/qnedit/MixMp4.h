#ifndef QNEDIT_MIX_MP4_H
#define QNEDIT_MIX_MP4_H

#include <cstdint>

#include "Input.h"
#include "MixEngine.h"
#include "OutputFile.h"
#include "QNMediaMuxer.h"
#include "ReadCoverage.h"

namespace qnedit {

// Writes the mix encoded as AAC into an MP4 or M4A (`muxFormat`): the main
// file's video tracks are copied sample for sample, its device items are
// carried, and the audio lasts `audioDurationUs` (the main audio's length)
// with the encoder's priming cut by an edit. Damage in the video tracks is
// noted in *videoCoverage. The muxer is returned unstopped: the caller
// reports damage before the output is kept (finishOutput).
android::sp<android::qnmediaeditor::QNMediaMuxer> writeMixedMp4(Input& main, MixEngine& mix, int64_t audioDurationUs, int muxFormat, OutputFile& out,
                   ReadCoverage* videoCoverage);

}  // namespace qnedit

#endif
