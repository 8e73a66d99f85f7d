#ifndef FUZZ_WAVEFORM_TARGET_H
#define FUZZ_WAVEFORM_TARGET_H

// PCM of any layout and length through the waveform builder. Layout: channel
// count, bytes per sample, sample rate, interview flag, then chunks of PCM.
#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>

#include "FuzzInput.h"
#include "QNMediaAudioWaveForm.h"

namespace fuzztargets {

inline void fuzzWaveform(const uint8_t* data, size_t size) {
    using namespace android;
    using namespace android::qnmediaeditor;
    FuzzInput in(data, size);
    sp<AMessage> format = new AMessage;
    format->setInt32("channel-count", in.u8() % 4);
    format->setInt32("bits-per-sample", (in.u8() % 5) * 8);
    format->setInt32("sample-rate", static_cast<int32_t>(in.u32() % 200000));
    format->setInt32("AM-interview", in.u8() & 1);
    sp<QNMediaAudioWaveForm> waveform = new QNMediaAudioWaveForm();
    waveform->init(format);
    for (int i = 0; i < 256; ++i) {
        const size_t sevens = in.u8();
        const size_t chunk = sevens * 7 + in.u8();
        size_t got;
        const uint8_t* pcm = in.take(chunk, &got);
        if (got == 0) break;
        sp<ABuffer> buffer = ABuffer::CreateAsCopy(pcm, got);
        waveform->addSample(buffer);
    }
    sp<ABuffer> values;
    int count;
    waveform->getSamples(&values, &count);
}

}  // namespace fuzztargets

#endif
