#ifndef MPEG4_SAMPLE_ENTRY_H_
#define MPEG4_SAMPLE_ENTRY_H_

#include <cstdint>

#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ByteReader.h>
#include <utils/Errors.h>

namespace android {
namespace mpeg4 {

struct CodecInfo {
    bool isVideo = false;
    bool isAudio = false;
    // Width of the length prefix of each NAL unit in AVC/HEVC samples; 0 for
    // other codecs.
    uint32_t nalLengthSize = 0;
    // Average bitrate the description declares; 0 when it declares none.
    uint32_t avgBitrate = 0;
};

// Reads the first entry of a sample description box ('stsd' payload) into
// `meta`: MIME type, codec configuration, picture size or audio format.
// ERROR_UNSUPPORTED for a codec this extractor does not hand out,
// ERROR_MALFORMED for an entry that cannot be read.
status_t ParseSampleDescription(ByteReader stsd, MetaData* meta, CodecInfo* info);

}  // namespace mpeg4
}  // namespace android

#endif
