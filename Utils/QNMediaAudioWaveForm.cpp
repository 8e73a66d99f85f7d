#define LOG_TAG "QNMediaAudioWaveForm"

#include "QNMediaAudioWaveForm.h"

#include <algorithm>
#include <climits>
#include <cstring>
#include <new>

#include <log/log.h>

namespace android {
namespace qnmediaeditor {

namespace {

constexpr int64_t kIntervalUs = 20000;

static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "PCM is read in host order");

// Magnitude kept in 16 bits: -32768 wraps to itself and so never raises a peak.
inline int16_t wrapAbs16(int16_t s) { return static_cast<int16_t>(s < 0 ? -static_cast<int32_t>(s) : s); }
inline int8_t wrapAbs8(int8_t s) { return static_cast<int8_t>(s < 0 ? -static_cast<int32_t>(s) : s); }

inline int16_t load16(const uint8_t* p) {
    int16_t s;
    memcpy(&s, p, sizeof(s));
    return s;
}

// Peak magnitudes over n frames; written as plain loops so they vectorise.
int16_t peakMono16(const uint8_t* p, int64_t n, int16_t peak) {
    for (int64_t i = 0; i < n; ++i) peak = std::max(peak, wrapAbs16(load16(p + 2 * i)));
    return peak;
}
void peakStereo16(const uint8_t* p, int64_t n, int16_t* left, int16_t* right) {
    int16_t l = *left, r = *right;
    for (int64_t i = 0; i < n; ++i) {
        l = std::max(l, wrapAbs16(load16(p + 4 * i)));
        r = std::max(r, wrapAbs16(load16(p + 4 * i + 2)));
    }
    *left = l;
    *right = r;
}
int16_t peakMono24(const uint8_t* p, int64_t n, int16_t peak) {
    for (int64_t i = 0; i < n; ++i) {
        const int16_t v = static_cast<int16_t>((p[3 * i + 2] << 8) | p[3 * i + 1]);
        peak = std::max(peak, wrapAbs16(v));
    }
    return peak;
}
void peakStereo24(const uint8_t* p, int64_t n, int16_t* left, int16_t* right) {
    int16_t l = *left, r = *right;
    for (int64_t i = 0; i < n; ++i) {
        l = std::max<int16_t>(l, wrapAbs8(static_cast<int8_t>(p[6 * i + 2])));
        r = std::max<int16_t>(r, wrapAbs8(static_cast<int8_t>(p[6 * i + 5])));
    }
    *left = l;
    *right = r;
}

// The value byte of each channel: the high byte of a 16-bit peak, or an 8-bit peak itself.
inline int16_t withHigh(int16_t peak, int byte) {
    return static_cast<int16_t>((static_cast<uint16_t>(peak) & 0x00FF) | ((byte & 0xFF) << 8));
}
inline int16_t withLow(int16_t peak, int byte) {
    return static_cast<int16_t>((static_cast<uint16_t>(peak) & 0xFF00) | (byte & 0xFF));
}

}  // namespace

QNMediaAudioWaveForm::QNMediaAudioWaveForm()
    : mFormat(nullptr),
      mIsValid(false),
      mUseExistWaveForm(false),
      mIntervalUs(kIntervalUs),
      mLastTimeUs(-1),
      mChannelCount(0),
      mBytesPerSample(0),
      mSampleRate(0),
      mWaveFormCount(0),
      mWaveForm(nullptr),
      mFrameInterval(0),
      mFrameCounter(0),
      mPeak(0),
      mLeftPeak(0),
      mRightPeak(0),
      mInterview(0) {}

QNMediaAudioWaveForm::~QNMediaAudioWaveForm() {
    mWaveForm.clear();
    mFormat.clear();
}

status_t QNMediaAudioWaveForm::init(sp<AMessage>& format) {
    mFormat = format;
    if (format == nullptr || !format->findInt32("channel-count", &mChannelCount) ||
        !format->findInt32("bits-per-sample", &mBytesPerSample) ||
        !format->findInt32("sample-rate", &mSampleRate)) {
        ALOGD("not use waveform");
        return OK;
    }
    mBytesPerSample /= 8;
    format->findInt32("AM-interview", &mInterview);

    sp<ABuffer> existing;
    if (format->findBuffer("AM-waveform", &existing) && existing != nullptr) {
        sp<ABuffer> copy = ABuffer::CreateAsCopy(existing->data(), existing->size());
        if (copy == nullptr) {
            ALOGD("not use waveform");
            return OK;
        }
        copy->setRange(0, existing->size());
        mWaveForm = copy;
        mIsValid = false;
        mUseExistWaveForm = true;
        mWaveFormCount = static_cast<int32_t>(std::min<size_t>(existing->size() / 2, INT32_MAX));
        ALOGD("use exist waveform");
        return OK;
    }

    int32_t notEncode = 0;
    if (format->findInt32("AM-not-encode", &notEncode) && notEncode != 0) {
        mIsValid = false;
        mUseExistWaveForm = false;
        ALOGD("not use encoder");
        ALOGD("not use waveform");
        return OK;
    }
    if ((mChannelCount != 1 && mChannelCount != 2) || (mBytesPerSample != 2 && mBytesPerSample != 3)) {
        ALOGD("not use waveform");
        return OK;
    }

    const size_t bytes = 2 * static_cast<size_t>(kMaxWaveFormCount);
    sp<ABuffer> buffer = new (std::nothrow) ABuffer(bytes);
    if (buffer == nullptr || buffer->base() == nullptr) {
        ALOGD("not use waveform");
        return OK;
    }
    memset(buffer->base(), 0, bytes);
    mWaveForm = buffer;
    mIsValid = true;
    mUseExistWaveForm = false;
    mFrameInterval = mSampleRate / 50 - 1;
    if ((static_cast<int64_t>(mSampleRate) * kIntervalUs) % 1000000 != 0) {
        ALOGW("The interval-count is weird");
    }
    ALOGD("make waveform frameinterval = %d", mFrameInterval);
    return OK;
}

bool QNMediaAudioWaveForm::isValid() { return mIsValid; }

void QNMediaAudioWaveForm::cancel() {
    mIsValid = false;
    mUseExistWaveForm = false;
}

status_t QNMediaAudioWaveForm::addSample(sp<ABuffer>& buffer) {
    if (!mIsValid) {
        ALOGD("not supported format");
        return kError;
    }
    if (buffer == nullptr) {
        ALOGD("invalid");
        return kError;
    }
    const size_t size = std::min<size_t>(buffer->size(), INT_MAX);
    getMaxAmplitude(reinterpret_cast<signed char*>(buffer->data()), static_cast<int>(size));
    return OK;
}

int QNMediaAudioWaveForm::getMaxAmplitude(signed char* data, int size) {
    if (mBytesPerSample == 3) return getMaxAmplitude24(data, size / 3);
    if (mBytesPerSample == 2) return getMaxAmplitude16(reinterpret_cast<short*>(data), size / 2);
    mIsValid = false;
    return kError;
}

int64_t QNMediaAudioWaveForm::framesToClose() const {
    if (mFrameInterval == 0 || mFrameCounter > mFrameInterval || mFrameCounter < 0) return -1;
    return static_cast<int64_t>(mFrameInterval) - mFrameCounter + 1;
}

void QNMediaAudioWaveForm::advanceCounter(int64_t n) {
    mFrameCounter = static_cast<int32_t>(std::min<int64_t>(INT32_MAX, mFrameCounter + n));
}

void QNMediaAudioWaveForm::closeInterval() {
    addWaveformData(mPeak);
    mFrameCounter = 0;
    mPeak = 0;
    mLeftPeak = 0;
    mRightPeak = 0;
}

int QNMediaAudioWaveForm::getMaxAmplitude16(short* data, int count) {
    return measure(reinterpret_cast<const uint8_t*>(data), count, 2);
}

int QNMediaAudioWaveForm::getMaxAmplitude24(signed char* data, int count) {
    return measure(reinterpret_cast<const uint8_t*>(data), count, 3);
}

// Walks the frames in runs that end where an interval closes, so the per-frame
// work is only the peak compare.
int QNMediaAudioWaveForm::measure(const uint8_t* p, int count, int sampleBytes) {
    const bool stereo = mChannelCount == 2;
    const bool wide = sampleBytes == 2;  // 16-bit peaks give their high byte to a stereo value
    const int64_t frames = (count <= 0 || p == nullptr) ? 0 : count / (stereo ? 2 : 1);
    const int64_t frameBytes = sampleBytes * (stereo ? 2 : 1);
    for (int64_t done = 0; done < frames;) {
        const int64_t toClose = framesToClose();
        const int64_t n = (toClose < 0) ? frames - done : std::min(toClose, frames - done);
        if (stereo) {
            int16_t l = mLeftPeak, r = mRightPeak;
            (wide ? peakStereo16 : peakStereo24)(p, n, &l, &r);
            if (l > mLeftPeak) mLeftPeak = l, mPeak = withHigh(mPeak, wide ? l >> 8 : l);
            if (r > mRightPeak) mRightPeak = r, mPeak = withLow(mPeak, wide ? r >> 8 : r);
        } else {
            mPeak = (wide ? peakMono16 : peakMono24)(p, n, mPeak);
        }
        p += n * frameBytes;
        done += n;
        if (n == toClose) {
            closeInterval();
        } else {
            advanceCounter(n);
        }
    }
    return mPeak;
}

bool QNMediaAudioWaveForm::checkInterval(short value) {
    if (mFrameInterval != 0 && mFrameCounter == mFrameInterval) {
        addWaveformData(value);
        mFrameCounter = 0;
        return true;
    }
    advanceCounter(1);
    return false;
}

void QNMediaAudioWaveForm::addWaveformData(short value) {
    if (mWaveFormCount >= kMaxWaveFormCount) {
        ALOGD("too many data, ignore");
        mIsValid = false;
        return;
    }
    if (mWaveForm == nullptr || mWaveForm->capacity() < 2 * static_cast<size_t>(mWaveFormCount) + 2) return;
    int32_t v = value;
    if (mChannelCount == 2 && mInterview == 0) {
        // (left byte + right byte) * 128: the mean of the channels back in 16 bits.
        v = static_cast<int32_t>((static_cast<uint32_t>(v) >> 1) & 0xFF80) +
            static_cast<int8_t>(v & 0xFF) * 128;
    }
    uint8_t* out = mWaveForm->base() + 2 * static_cast<size_t>(mWaveFormCount);
    out[0] = static_cast<uint8_t>((v >> 8) & 0xFF);
    out[1] = static_cast<uint8_t>(v & 0xFF);
    ++mWaveFormCount;
}

status_t QNMediaAudioWaveForm::getSamples(sp<ABuffer>* buffer, int* count) {
    if (!mIsValid && !mUseExistWaveForm) {
        ALOGD("invalid");
        return kError;
    }
    if (count == nullptr || buffer == nullptr || mWaveFormCount == 0) {
        ALOGD("invalid");
        return kError;
    }
    if (mWaveFormCount >= kMaxWaveFormCount) {
        ALOGD("invalid mWaveFormCount = %d", mWaveFormCount);
        return kError;
    }
    mWaveForm->setRange(0, 2 * static_cast<size_t>(mWaveFormCount));
    *buffer = mWaveForm;
    *count = mWaveFormCount;
    return OK;
}

}  // namespace qnmediaeditor
}  // namespace android
