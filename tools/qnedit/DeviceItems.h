#ifndef QNEDIT_DEVICE_ITEMS_H
#define QNEDIT_DEVICE_ITEMS_H

#include <cstdint>
#include <string>

#include <media/stagefright/foundation/ABuffer.h>

#include "Input.h"
#include "QNMediaMuxer.h"

namespace qnedit {

// Parses an ISO 6709 point ("+DD.DDDD+DDD.DDDD/") into 1e-4 degree units.
bool parseIso6709(const std::string& text, int* latitude, int* longitude);

// The stored waveform cut to [startUs, endUs): one value per 20 ms, so the
// kept values are those whose interval starts inside the range.
android::sp<android::ABuffer> cutWaveform(const android::sp<android::ABuffer>& waveform, int64_t startUs,
                                          int64_t endUs, int* count);

// Hands the source's device items (orientation, location, UUID data,
// recording type, user message, VR metadata, bookmark size, waveform cut to
// the kept range) to a muxer that has not started.
void copyDeviceItems(const Input& in, android::qnmediaeditor::QNMediaMuxer& muxer, int outputFormat,
                     int64_t startUs, int64_t endUs);

}  // namespace qnedit

#endif
