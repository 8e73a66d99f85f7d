#include <gtest/gtest.h>

#include <random>

#include "LogCapture.h"
#include "QNMediaEditorDefs.h"
#include "QNMediaEditorUtils.h"
#include "UtilsTestHelpers.h"

using namespace android;
using namespace android::qnmediaeditor;

// Every input goes through an exactly sized heap copy, so a read one byte too
// far is caught by the address sanitizer.
namespace {

void feedEverything(const Bytes& input) {
    QNMediaEditorUtils utils;
    const Bytes copy = input;
    const uint8_t* data = copy.data();
    size_t size = copy.size();
    const uint8_t* unit;
    size_t unitSize;
    for (int i = 0; i < 64 && QNMediaEditorUtils::getNextNALUnit(&data, &size, &unit, &unitSize, true) == OK; ++i) {
    }
    for (unsigned type : {1u, 5u, 7u, 8u}) utils.FindNAL(copy.data(), copy.size(), type);
    QNMediaEditorUtils::IsAVCReferenceFrame(new MediaCodecBuffer(new AMessage, bufferOf(copy)));

    int w = 0, h = 0, cw = 0, ch = 0;
    utils.FindAVCDimensions(bufferOf(copy), &w, &h, &cw, &ch);
    QNMediaEditorUtils::FindHEVCDimensions(bufferOf(copy), &w, &h, &cw, &ch);

    Bytes mutableCopy = copy;
    int n = static_cast<int>(mutableCopy.size());
    sp<MetaData> meta = new MetaData;
    utils.setAVCCSeqHeader(mutableCopy.empty() ? nullptr : mutableCopy.data(), n, meta);

    sp<MetaData> avcc = new MetaData;
    avcc->setData(kEditorKeyAVCC, kEditorTypeAVCC, copy.data(), copy.size());
    sp<AMessage> format;
    utils.convertMetaDataToMessageAVCCSD(avcc, &format);
    avcc->setData(kKeyHVCC, kTypeHVCC, copy.data(), copy.size());
    avcc->setData(kKeyESDS, kTypeESDS, copy.data(), copy.size());
    QNMediaEditorUtils::ConvertMetaDataToMessage(avcc, &format);
}

const Bytes kSamples[] = {
    // Annex-B SPS and PPS
    {0x00, 0x00, 0x00, 0x01, 0x67, 0x64, 0x00, 0x1F, 0xAD, 0x84, 0x40, 0x59, 0x40, 0x50, 0x05, 0xB9,
     0x00, 0x00, 0x00, 0x01, 0x68, 0xCE, 0x3C, 0x80},
    // length-prefixed pair
    {0x00, 0x09, 0x67, 0x42, 0xC0, 0x1E, 0xDA, 0x02, 0x80, 0xF6, 0x40, 0x00, 0x04, 0x68, 0xCE, 0x3C, 0x80},
    // avcC record
    {0x01, 0x42, 0xC0, 0x1E, 0xFD, 0xE1, 0x00, 0x09, 0x67, 0x42, 0xC0, 0x1E,
     0xDA, 0x02, 0x80, 0xF6, 0x40, 0x01, 0x00, 0x04, 0x68, 0xCE, 0x3C, 0x80},
    // HEVC csd
    {0x00, 0x00, 0x00, 0x01, 0x40, 0x01, 0x0C, 0x01, 0x00, 0x00, 0x00, 0x01, 0x42, 0x01, 0x01,
     0x01, 0x60, 0x00, 0x00, 0x03, 0x00, 0x90, 0x00, 0x00, 0x03, 0x00, 0x00, 0x03, 0x00, 0x78,
     0xA0, 0x03, 0xC0, 0x80, 0x11, 0x07, 0xCB, 0x00, 0x00, 0x00, 0x01, 0x44, 0x01, 0xC1, 0x72},
    // SPS unit with header, as FindAVCDimensions takes it
    {0x67, 0x64, 0x00, 0x28, 0xAC, 0xB2, 0x80, 0xF0, 0x04, 0x4F, 0xCA, 0x80},
};

}  // namespace

TEST(HostileInputTest, EveryPrefixOfTheSampleBuffersStaysInBounds) {
    LogCapture quiet;
    for (const Bytes& sample : kSamples) {
        for (size_t n = 0; n <= sample.size(); ++n) feedEverything(Bytes(sample.begin(), sample.begin() + n));
    }
}

TEST(HostileInputTest, RandomAndDegenerateBytesStayInBounds) {
    LogCapture quiet;
    std::mt19937 rng(7);
    for (int round = 0; round < 3000; ++round) {
        Bytes b(rng() % 48);
        for (uint8_t& x : b) {
            // Mostly zeros, ones and 0x03 so that start codes, emulation
            // bytes and long Exp-Golomb prefixes are common.
            const uint32_t r = rng() % 8;
            x = r < 3 ? 0 : r == 3 ? 1 : r == 4 ? 3 : static_cast<uint8_t>(rng());
        }
        if (round % 3 == 0 && b.size() >= 4) b[0] = b[1] = b[2] = 0, b[3] = 1;
        feedEverything(b);
    }
    // Long runs of zero bits must end every Exp-Golomb read.
    feedEverything(Bytes(64, 0x00));
    Bytes spsZeros(40, 0x00);
    spsZeros[0] = 0x67;
    spsZeros[1] = 100;
    feedEverything(spsZeros);
}
