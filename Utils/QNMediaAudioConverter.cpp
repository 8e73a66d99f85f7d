#define LOG_TAG "QNMediaAudioConverter"

#include "QNMediaAudioConverter.h"

#include <cstdlib>
#include <new>

#include <log/log.h>

namespace android {
namespace qnmediaeditor {

namespace {
// Conversion kinds of the parameter block, applied in the order channels, format, rate.
constexpr int32_t kKindChannels = 0;
constexpr int32_t kKindSampleRate = 1;
constexpr int32_t kKindFormat = 2;
}  // namespace

int audioFormatCodeOf(int bitsPerSample) {
    switch (bitsPerSample) {
        case 8: return 1;
        case 16: return 2;
        case 24: return 3;
        case 32: return 4;
        default: return 2;
    }
}

QNMediaAudioConverter::QNMediaAudioConverter() : mConverter(new (std::nothrow) QNAudioFormatConverter) {}

QNMediaAudioConverter::~QNMediaAudioConverter() {
    if (mConverter != nullptr) {
        mConverter->deinitAFC();
        delete mConverter;
        mConverter = nullptr;
    }
}

bool QNMediaAudioConverter::isValid() { return mConverter != nullptr; }

int QNMediaAudioConverter::getAudioFormat(int bitsPerSample) { return audioFormatCodeOf(bitsPerSample); }

bool QNMediaAudioConverter::init(int in1, int in2, int inBits, int out1, int out2, int outBits) {
    if (mConverter == nullptr) {
        ALOGE("converter is null");
        return false;
    }
    const int inCode = getAudioFormat(inBits);
    mConverter->initAFC(inCode, in1, 0, in2);

    QNAFCParam param{};
    const int outCode = getAudioFormat(outBits);
    param.format = outCode;
    param.sampleRate = out1;
    param.channels = out2;
    if (in2 != out2) {
        param.kind = kKindChannels;
        mConverter->setParamAFC(&param);
    }
    if (inCode != outCode) {
        param.kind = kKindFormat;
        mConverter->setParamAFC(&param);
    }
    if (in1 != out1) {
        param.kind = kKindSampleRate;
        mConverter->setParamAFC(&param);
    }
    return true;
}

int QNMediaAudioConverter::process(unsigned char* in, unsigned char* out, int size) {
    if (mConverter == nullptr) {
        ALOGE("converter is null");
        return 0;
    }
    return mConverter->processAFC(in, out, size);
}

unsigned char* QNMediaAudioConverter::allocateBuff(unsigned char* buffer, int size, float value) {
    if (mConverter == nullptr) {
        ALOGE("converter is null");
        return nullptr;
    }
    return mConverter->allocateBuffAFC(buffer, size, value);
}

void QNMediaAudioConverter::freeBuff(unsigned char* buffer) {
    if (buffer != nullptr) free(buffer);
}

}  // namespace qnmediaeditor
}  // namespace android
