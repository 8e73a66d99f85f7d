#ifndef QNEDIT_FRAME_PICTURE_H
#define QNEDIT_FRAME_PICTURE_H

#include <cstdint>
#include <string>

#include <media/stagefright/foundation/AMessage.h>

#include "Png.h"

namespace qnedit {

// A decoded 4:2:0 frame as the viewer sees it: its crop through the colour
// converter (RGB 5:6:5, widened for the PNG), then turned clockwise by
// `rotation` degrees (0, 90, 180 or 270; others count as 0). The format
// carries the keys the converter reads. A refusal is an input error naming
// `what`.
RgbImage framePicture(const android::sp<android::AMessage>& format, const uint8_t* yuv, int rotation,
                      const std::string& what);

}  // namespace qnedit

#endif
