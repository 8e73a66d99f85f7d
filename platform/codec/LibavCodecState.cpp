#define LOG_TAG "LibavCodecState"
#include "codec/LibavCodecState.h"

#include <cstring>

#include <log/log.h>

extern "C" {
#include <libavutil/frame.h>
#include <libavutil/mem.h>
}

namespace android {

LibavCodecState::~LibavCodecState() {
    av_frame_free(&frame);
    av_packet_free(&packet);
    avcodec_free_context(&context);
}

bool LibavCodecState::allocate(const AVCodec* codec) {
    if (codec == nullptr || (context = avcodec_alloc_context3(codec)) == nullptr ||
        (packet = av_packet_alloc()) == nullptr || (frame = av_frame_alloc()) == nullptr) {
        ALOGE("cannot set up a codec");
        return false;
    }
    return true;
}

bool LibavCodecState::setExtradata(const std::vector<uint8_t>& data) {
    const size_t size = data.size();
    if (size > size_t(INT32_MAX - AV_INPUT_BUFFER_PADDING_SIZE)) return false;
    context->extradata = static_cast<uint8_t*>(av_mallocz(size + AV_INPUT_BUFFER_PADDING_SIZE));
    if (context->extradata == nullptr) return false;
    if (size > 0) memcpy(context->extradata, data.data(), size);
    context->extradata_size = static_cast<int>(size);
    return true;
}

}  // namespace android
