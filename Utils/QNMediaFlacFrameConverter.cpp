#define LOG_TAG "QNMediaFlacFrameConverter"

#include "QNMediaFlacFrameConverter.h"

#include <cstring>
#include <new>

#include <log/log.h>
#include <media/stagefright/FLACCrc.h>

namespace android {
namespace qnmediaeditor {

namespace {

constexpr size_t kStreamInfoHeaderSize = 42;  // "fLaC" + block header + STREAMINFO body
constexpr uint32_t kMaxCodeSize = 7;

// VORBIS_COMMENT, last block: 40 bytes of vendor string and no comments.
const uint8_t kVorbisCommentBlock[44] = {
    0x84, 0x00, 0x00, 0x28, 0x20, 0x00, 0x00, 0x00,
    'r', 'e', 'f', 'e', 'r', 'e', 'n', 'c', 'e', ' ', 'l', 'i', 'b', 'F', 'L', 'A', 'C', ' ',
    '1', '.', '3', '.', '2', ' ', '2', '0', '1', '7', '0', '1', '0', '1',
    0x00, 0x00, 0x00, 0x00,
};

// Continuation bytes of a coded number carry 6 bits each, under a 10xxxxxx prefix.
bool isContinuation(unsigned char c) { return (c & 0xC0) == 0x80; }

}  // namespace

QNMediaFlacFrameConverter::QNMediaFlacFrameConverter(sp<AMessage>& format)
    : mFrameNumber(0), mCSDBuffer(nullptr) {
    ALOGV("QNMediaFlacFrameConverter");
    if (format == nullptr) return;
    sp<ABuffer> csd;
    if (!format->findBuffer("csd-0", &csd) || csd == nullptr) return;
    ALOGV("csd size = %d", static_cast<int>(csd->size()));
    if (csd->size() < kStreamInfoHeaderSize) {
        // Without a whole STREAMINFO there is no header to build.
        ALOGE("csd size error %zu", csd->size());
        return;
    }
    csd->setRange(csd->offset(), kStreamInfoHeaderSize);

    const size_t headerSize = kStreamInfoHeaderSize + sizeof(kVorbisCommentBlock);
    sp<ABuffer> header = new (std::nothrow) ABuffer(headerSize);
    if (header == nullptr || header->base() == nullptr) return;
    memcpy(header->data(), csd->data(), kStreamInfoHeaderSize);
    memcpy(header->data() + kStreamInfoHeaderSize, kVorbisCommentBlock, sizeof(kVorbisCommentBlock));
    header->setRange(0, headerSize);
    header->data()[4] = 0;  // STREAMINFO is no longer the last block
    mCSDBuffer = header;
}

QNMediaFlacFrameConverter::~QNMediaFlacFrameConverter() {
    ALOGV("~QNMediaFlacFrameConverter");
    mCSDBuffer.clear();
}

bool QNMediaFlacFrameConverter::getCSDBuffer(sp<ABuffer>* buffer, int64_t timeUs) {
    if (mCSDBuffer == nullptr) {
        ALOGE("mCSDBuffer == NULL");
        return false;
    }
    sp<ABuffer> copy = ABuffer::CreateAsCopy(mCSDBuffer->data(), mCSDBuffer->size());
    if (copy == nullptr) {
        ALOGE("buffer == NULL");
        return false;
    }
    copy->setRange(0, mCSDBuffer->size());
    copy->meta()->clear();
    copy->meta()->setInt64("timeUs", timeUs);
    copy->meta()->setInt32("AM-flacCSD", 1);
    if (buffer != nullptr) *buffer = copy;
    return true;
}

bool QNMediaFlacFrameConverter::convert(sp<ABuffer>& inBuffer, sp<ABuffer>* outBuf) {
    if (inBuffer == nullptr || outBuf == nullptr) {
        ALOGD("convert: null buffer");
        return false;
    }
    ConvertInfo info{};
    if (!getFrameHeaderInfo(inBuffer, info)) return false;
    return setFrameHeaderInfo(inBuffer, outBuf, info);
}

bool QNMediaFlacFrameConverter::getFrameHeaderInfo(sp<ABuffer>& inBuffer, ConvertInfo& info) {
    static const uint32_t kBlockSizeTrailer[16] = {0, 0, 0, 0, 0, 0, 1, 2, 0, 0, 0, 0, 0, 0, 0, 0};
    static const uint32_t kSampleRateTrailer[3] = {1, 2, 2};

    const size_t inSize = inBuffer->size();
    if (inSize <= 7) {
        ALOGE("input buffer size error %zu", inSize);
        return false;
    }
    const unsigned char* p = inBuffer->data();
    const unsigned char blocking = p[1] & 0x01;
    const unsigned char b2 = p[2];

    uint64_t number = 0;
    uint32_t codeSize = 0;
    // The coded number must lie inside the frame, whatever its lead byte claims.
    const uint32_t avail = inSize - 4 > kMaxCodeSize ? kMaxCodeSize : static_cast<uint32_t>(inSize - 4);
    if (!readUTF8UCS2(p + 4, avail, &number, &codeSize, blocking)) {
        ALOGE("readUTF8UCS2 failed");
        return false;
    }
    const uint32_t rateCode = b2 & 0x0F;
    const uint32_t extra =
        kBlockSizeTrailer[b2 >> 4] + (rateCode >= 12 && rateCode <= 14 ? kSampleRateTrailer[rateCode - 12] : 0);

    const uint32_t crc8Pos = 4 + codeSize + extra;
    const uint64_t crc16Pos = inSize - 2;
    if (crc8Pos + 1 > crc16Pos) {
        ALOGE("size error");
        return false;
    }
    info.utf8Pos = 4;
    info.utf8Size = codeSize;
    info.extraSize = extra;
    info.crc8Pos = crc8Pos;
    info.crc16Pos = static_cast<uint32_t>(crc16Pos);
    info.variableBlockSize = blocking;
    return true;
}

bool QNMediaFlacFrameConverter::setFrameHeaderInfo(sp<ABuffer>& inBuffer, sp<ABuffer>* outBuf, ConvertInfo& info) {
    unsigned char code[kMaxCodeSize];
    uint32_t newSize = 0;
    if (!makeUTF8UCS2(mFrameNumber, code, &newSize, info.variableBlockSize)) return false;

    const size_t inSize = inBuffer->size();
    // A ConvertInfo that does not describe this buffer must not lead the copies astray.
    if (inSize > UINT32_MAX - kMaxCodeSize || info.utf8Pos != 4 || info.utf8Size > kMaxCodeSize ||
        info.extraSize > 4 || info.crc8Pos != info.utf8Pos + info.utf8Size + info.extraSize ||
        static_cast<uint64_t>(info.crc8Pos) + 3 > inSize) {
        ALOGE("size error");
        return false;
    }
    const uint32_t outDataSize = static_cast<uint32_t>(inSize - info.utf8Size + newSize);
    sp<ABuffer> out = new (std::nothrow) ABuffer(outDataSize);
    if (out == nullptr || out->base() == nullptr) {
        ALOGE("outBuf == NULL");
        return false;
    }
    int64_t timeUs = 0;
    if (!inBuffer->meta()->findInt64("timeUs", &timeUs)) {
        ALOGE("input buffer without timeUs");
        return false;
    }

    const unsigned char* in = inBuffer->data();
    unsigned char* dst = out->data();
    uint32_t outPos = 0;
    memcpy(dst, in, info.utf8Pos);
    outPos += info.utf8Pos;
    memcpy(dst + outPos, code, newSize);
    outPos += newSize;
    if (info.extraSize > 0) {
        memcpy(dst + outPos, in + info.utf8Pos + info.utf8Size, info.extraSize);
        outPos += info.extraSize;
    }
    dst[outPos] = crc8(dst, outPos);
    ++outPos;
    const uint32_t bodySize = static_cast<uint32_t>(inSize - 2 - (info.crc8Pos + 1));
    memcpy(dst + outPos, in + info.crc8Pos + 1, bodySize);
    outPos += bodySize;
    const uint16_t frameCrc = FLACCrc16(dst, outDataSize - 2);
    dst[outPos++] = static_cast<unsigned char>(frameCrc >> 8);
    dst[outPos++] = static_cast<unsigned char>(frameCrc & 0xFF);
    if (outPos != outDataSize) {
        ALOGE("outPos = %u, outDataSize = %u", outPos, outDataSize);
        return false;
    }

    out->setRange(0, outDataSize);
    out->meta()->clear();
    out->meta()->setInt64("timeUs", timeUs);
    *outBuf = out;
    ++mFrameNumber;
    return true;
}

bool QNMediaFlacFrameConverter::readUTF8UCS2(unsigned char* data, uint64_t* value, uint32_t* size,
                                             unsigned char allow36Bits) {
    return readUTF8UCS2(data, kMaxCodeSize, value, size, allow36Bits);
}

bool QNMediaFlacFrameConverter::readUTF8UCS2(const unsigned char* data, uint32_t avail, uint64_t* value,
                                             uint32_t* size, unsigned char allow36Bits) {
    if (avail == 0) {
        ALOGE(" readUTF8UCS2 beyond the frame");
        *value = ~0ULL;
        return false;
    }
    const unsigned char b = data[0];
    if ((b & 0x80) == 0) {
        *size = 1;
        *value = b;
        return true;
    }
    // Bit 7 is set, so n follows from the highest clear bit among bits 5..1.
    uint32_t n;
    uint64_t v;
    if ((b & 0x20) == 0) {
        n = 1; v = b & 0x1F;
    } else if ((b & 0x10) == 0) {
        n = 2; v = b & 0x0F;
    } else if ((b & 0x08) == 0) {
        n = 3; v = b & 0x07;
    } else if ((b & 0x04) == 0) {
        n = 4; v = b & 0x03;
    } else if ((b & 0x02) == 0) {
        n = 5; v = b & 0x01;
    } else if ((b & 0x01) == 0 && allow36Bits) {
        n = 6; v = 0;
    } else {
        ALOGE(" readUTF8UCS2 over %s bit", allow36Bits ? "36" : "31");
        *value = ~0ULL;
        return false;
    }
    *size = n + 1;
    for (uint32_t i = 1; i <= n; ++i) {
        if (i >= avail) {
            ALOGE(" readUTF8UCS2 beyond the frame");
            *value = ~0ULL;
            return false;
        }
        const unsigned char c = data[i];
        if (!isContinuation(c)) {
            ALOGE(" readUTF8UCS2 not 10xxxxxx");
            *value = ~0ULL;
            return false;
        }
        v = (v << 6) | (c & 0x3F);
    }
    *value = v;
    return true;
}

bool QNMediaFlacFrameConverter::makeUTF8UCS2(uint64_t value, unsigned char* out, uint32_t* size,
                                             unsigned char allow36Bits) {
    uint32_t n;            // continuation bytes
    unsigned char lead;
    if (value <= 0x7F) {
        out[0] = static_cast<unsigned char>(value);
        *size = 1;
        return true;
    } else if (value < (1ULL << 11)) {
        n = 1; lead = static_cast<unsigned char>(0xC0 | (value >> 6));
    } else if (value < (1ULL << 16)) {
        n = 2; lead = static_cast<unsigned char>(0xE0 | (value >> 12));
    } else if (value < (1ULL << 21)) {
        n = 3; lead = static_cast<unsigned char>(0xF0 | (value >> 18));
    } else if (value < (1ULL << 26)) {
        n = 4; lead = static_cast<unsigned char>(0xF8 | (value >> 24));
    } else if (value < (1ULL << 31)) {
        n = 5; lead = static_cast<unsigned char>(0xFC | (value >> 30));
    } else if (allow36Bits) {
        n = 6; lead = 0xFE;
    } else {
        return false;
    }
    out[0] = lead;
    for (uint32_t i = 0; i < n; ++i) {
        const uint32_t shift = 6 * (n - 1 - i);
        out[1 + i] = static_cast<unsigned char>(0x80 | ((value >> shift) & 0x3F));
    }
    *size = n + 1;
    return true;
}

uint8_t QNMediaFlacFrameConverter::crc8(const unsigned char* data, uint32_t size) { return FLACCrc8(data, size); }

uint16_t QNMediaFlacFrameConverter::crc16(const unsigned char* data, uint32_t size) { return FLACCrc16(data, size); }

uint16_t QNMediaFlacFrameConverter::crc16Sliced(const unsigned char* data, uint32_t size) {
    return FLACCrc16(data, size);
}

}  // namespace qnmediaeditor
}  // namespace android
