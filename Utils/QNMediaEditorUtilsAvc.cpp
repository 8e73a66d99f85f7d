// AVC sequence parameter set walk (ITU-T H.264 7.3.2.1.1) and building the
// decoder configuration record (ISO/IEC 14496-15 5.3.3.1).
#define LOG_TAG "QNMediaEditorUtils"
#include "QNMediaEditorUtils.h"

#include <cstring>
#include <vector>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/foundation/avc_utils.h>

#include "QNMediaEditorDefs.h"

namespace android {
namespace qnmediaeditor {

namespace {

struct AvcSizes {
    uint32_t width, height, cropWidth, cropHeight;
};

void skipScalingList(ABitReader* br, int entries) {
    int64_t last = 8, next = 8;
    for (int j = 0; j < entries; ++j) {
        if (next != 0) {
            const int64_t delta = parseSE(br);
            next = ((last + delta) % 256 + 256) % 256;
        }
        if (next != 0) last = next;
    }
}

// The reader ends each code when the data runs out (parseUE then gives 0 and
// single bits read as 0), so a truncated set gives sizes but never a read
// past the buffer. Arithmetic is unsigned 32-bit, wrapping on hostile values.
bool walkSps(const sp<ABuffer>& sps, AvcSizes* out) {
    if (sps == nullptr || sps->size() < 2) {
        ALOGW("sequence parameter set too small");
        return false;
    }
    ABitReader br(sps->data() + 1, sps->size() - 1);
    const uint32_t profile = br.getBits(8);
    br.skipBits(16);
    parseUE(&br);  // seq_parameter_set_id
    uint32_t chroma = 1;
    if (profile == 100 || profile == 110 || profile == 122 || profile == 244 || profile == 44 ||
        profile == 83 || profile == 86) {
        chroma = parseUE(&br);
        if (chroma == 3) br.skipBits(1);  // separate_colour_plane_flag
        parseUE(&br);                     // bit_depth_luma_minus8
        parseUE(&br);                     // bit_depth_chroma_minus8
        br.skipBits(1);                   // qpprime_y_zero_transform_bypass_flag
        if (br.getBits(1)) {
            ALOGW("seq_scaling_matrix_present_flag != 0u");
            const int lists = chroma == 3 ? 12 : 8;
            for (int i = 0; i < lists; ++i) {
                if (br.getBits(1)) skipScalingList(&br, i < 6 ? 16 : 64);
            }
        }
    }
    parseUE(&br);  // log2_max_frame_num_minus4
    const uint32_t pocType = parseUE(&br);
    if (pocType == 0) {
        parseUE(&br);  // log2_max_pic_order_cnt_lsb_minus4
    } else if (pocType == 1) {
        br.skipBits(1);  // delta_pic_order_always_zero_flag
        parseUE(&br);    // offset_for_non_ref_pic
        parseUE(&br);    // offset_for_top_to_bottom_field
        const uint32_t cycle = parseUE(&br);
        // Every code takes at least one bit, so a hostile count stops with the data.
        for (uint32_t i = 0; i < cycle && br.numBitsLeft() > 0; ++i) parseUE(&br);
    }
    parseUE(&br);    // max_num_ref_frames
    br.skipBits(1);  // gaps_in_frame_num_value_allowed_flag
    const uint32_t widthInMbsMinus1 = parseUE(&br);
    const uint32_t heightInMapUnitsMinus1 = parseUE(&br);
    const uint32_t frameMbsOnly = br.getBits(1);
    out->width = (widthInMbsMinus1 + 1) * 16;
    out->height = (2 - frameMbsOnly) * (heightInMapUnitsMinus1 + 1) * 16;
    out->cropWidth = out->width;
    out->cropHeight = out->height;
    if (!frameMbsOnly) br.skipBits(1);  // mb_adaptive_frame_field_flag
    br.skipBits(1);                      // direct_8x8_inference_flag
    if (br.getBits(1)) {                 // frame_cropping_flag
        const uint32_t left = parseUE(&br);
        const uint32_t right = parseUE(&br);
        const uint32_t top = parseUE(&br);
        const uint32_t bottom = parseUE(&br);
        uint32_t unitX, unitY;
        if (chroma == 0) {
            unitX = 1;
            unitY = 2 - frameMbsOnly;
        } else {
            unitX = chroma == 3 ? 1 : 2;
            unitY = (chroma == 1 ? 2 : 1) * (2 - frameMbsOnly);
        }
        out->cropWidth = out->width - unitX * (left + right);
        out->cropHeight = out->height - unitY * (top + bottom);
    }
    return true;
}

void appendUnit(std::vector<uint8_t>* record, const uint8_t* unit, size_t size) {
    record->push_back(static_cast<uint8_t>(size >> 8));
    record->push_back(static_cast<uint8_t>(size));
    record->insert(record->end(), unit, unit + size);
}

}  // namespace

unsigned QNMediaEditorUtils::parseUE(ABitReader* reader) {
    return reader != nullptr ? android::parseUE(reader) : 0;
}

void QNMediaEditorUtils::FindAVCDimensions(const sp<ABuffer>& sps, int* width, int* height) {
    AvcSizes sizes;
    if (!walkSps(sps, &sizes)) return;
    if (width != nullptr) *width = static_cast<int>(sizes.cropWidth);
    if (height != nullptr) *height = static_cast<int>(sizes.cropHeight);
}

void QNMediaEditorUtils::FindAVCDimensions(const sp<ABuffer>& sps, int* width, int* height, int* cropWidth,
                                           int* cropHeight) {
    AvcSizes sizes;
    if (!walkSps(sps, &sizes)) return;
    if (width != nullptr) *width = static_cast<int>(sizes.width);
    if (height != nullptr) *height = static_cast<int>(sizes.height);
    if (cropWidth != nullptr) *cropWidth = static_cast<int>(sizes.cropWidth);
    if (cropHeight != nullptr) *cropHeight = static_cast<int>(sizes.cropHeight);
}

status_t QNMediaEditorUtils::setAVCCSeqHeader(uint8_t* data, int& size, sp<MetaData>& meta) {
    if (size < 1) {
        ALOGE("setAVCCSeqHeader size <= 0");
        return ERROR_NOT_CONNECTED;
    }
    if (data == nullptr || meta == nullptr) return ERROR_NOT_CONNECTED;
    const size_t n = static_cast<size_t>(size);
    sp<ABuffer> copy = ABuffer::CreateAsCopy(data, n);
    if (copy == nullptr) return ERROR_NOT_CONNECTED;

    // The record copies bytes 1 to 3 of the sequence parameter set and keeps
    // 16-bit lengths; sets that do not fit are refused before anything is written.
    auto refuse = [](size_t spsSize, size_t ppsSize) {
        ALOGE("parameter sets of %zu and %zu bytes do not fit a configuration record", spsSize, ppsSize);
        return ERROR_NOT_CONNECTED;
    };
    int width = 0, height = 0;
    sp<ABuffer> sps = FindNAL(copy->data(), n, 7);
    sp<ABuffer> pps;
    const uint8_t* ppsData = nullptr;
    size_t ppsSize = 0;
    if (sps != nullptr) {
        if (sps->size() < 4 || sps->size() > 0xFFFF) return refuse(sps->size(), 0);
        FindAVCDimensions(sps, &width, &height);
        pps = FindNAL(copy->data(), n, 8);
        if (pps == nullptr) return ERROR_NOT_CONNECTED;
        ppsData = pps->data();
        ppsSize = pps->size();
        if (ppsSize > 0xFFFF) return refuse(sps->size(), ppsSize);
    } else {
        // Two units behind 16-bit big-endian lengths, or else a finished record.
        const size_t spsSize = n >= 4 ? (size_t(data[0]) << 8) | data[1] : 0;
        if (n < 4 || spsSize > n - 4 || data[2] != 0x67) {
            meta->setData(kEditorKeyAVCC, kEditorTypeAVCC, data, n);
            return OK;
        }
        if (spsSize < 4) return refuse(spsSize, 0);
        sps = new ABuffer(data + 2, spsSize);
        FindAVCDimensions(sps, &width, &height);
        ppsSize = (size_t(data[2 + spsSize]) << 8) | data[3 + spsSize];
        if (ppsSize > n - 4 - spsSize) {
            ALOGE("picture parameter set of %zu bytes overruns the input", ppsSize);
            return ERROR_NOT_CONNECTED;
        }
        ppsData = data + 4 + spsSize;
    }

    const uint8_t* s = sps->data();
    std::vector<uint8_t> record = {0x01, s[1], s[2], s[3], 0xFD, 0xE1};
    record.reserve(11 + sps->size() + ppsSize);
    appendUnit(&record, s, sps->size());
    record.push_back(0x01);
    appendUnit(&record, ppsData, ppsSize);
    meta->setData(kEditorKeyAVCC, kEditorTypeAVCC, record.data(), record.size());
    meta->setInt32(kEditorKeyWidth, width);
    meta->setInt32(kEditorKeyHeight, height);
    meta->setInt32(kEditorKeyStride, width);
    meta->setInt32(kEditorKeySliceHeight, height);
    ALOGI("found AVC codec config (%d x %d, %d-profile level %d.%d)", width, height, record[1], record[3] / 10,
          record[3] % 10);
    return OK;
}

}  // namespace qnmediaeditor
}  // namespace android
