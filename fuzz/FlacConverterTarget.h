#ifndef FUZZ_FLAC_CONVERTER_TARGET_H
#define FUZZ_FLAC_CONVERTER_TARGET_H

// FLAC frames of any bytes through the frame converter, with and without a
// stream header. Layout: header length, header, then frames behind 16-bit
// little-endian lengths.
#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>

#include "FuzzInput.h"
#include "QNMediaFlacFrameConverter.h"

namespace fuzztargets {

inline void fuzzFlacConverter(const uint8_t* data, size_t size) {
    using namespace android;
    using namespace android::qnmediaeditor;
    FuzzInput in(data, size);
    sp<AMessage> format = new AMessage;
    const uint8_t csdSize = in.u8();
    if (csdSize > 0) {
        size_t got;
        const uint8_t* csd = in.take(csdSize, &got);
        format->setBuffer("csd-0", ABuffer::CreateAsCopy(csd, got));
    }
    sp<QNMediaFlacFrameConverter> converter = new QNMediaFlacFrameConverter(format);
    sp<ABuffer> header;
    converter->getCSDBuffer(&header, 0);
    for (int i = 0; i < 64; ++i) {
        const size_t low = in.u8();
        const size_t frameSize = low | (size_t(in.u8()) << 8);
        size_t got;
        const uint8_t* frame = in.take(frameSize, &got);
        if (got == 0) break;
        sp<ABuffer> input = ABuffer::CreateAsCopy(frame, got);
        // A frame now and then without its time: the caller never does that,
        // but it must not break the converter.
        if (i % 7 != 6) input->meta()->setInt64("timeUs", i);
        sp<ABuffer> output;
        converter->convert(input, &output);
    }
}

}  // namespace fuzztargets

#endif
