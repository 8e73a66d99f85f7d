#ifndef PLATFORM_MP3_MP3_FRAME_HEADER_H_
#define PLATFORM_MP3_MP3_FRAME_HEADER_H_

#include <cstddef>
#include <cstdint>

#include <media/stagefright/DataSource.h>

namespace android {

// A layer III frame header (ISO/IEC 11172-3, 2.4.1.3 and 2.4.2.3; the lower
// rates of ISO/IEC 13818-3 and the unofficial MPEG 2.5).
struct MP3FrameHeader {
    int version = 0;          // 1, 2, or 25 for 2.5
    uint32_t sampleRate = 0;
    uint32_t channels = 0;
    uint32_t bitrate = 0;     // bit/s
    uint32_t frameBytes = 0;  // header included
    uint32_t samples = 0;     // per channel: 1152 or 576
    bool crc = false;
    // Bytes between the header (and its CRC) and the main data.
    uint32_t sideInfoBytes() const;
};

// False for anything but a layer III header with a defined rate and
// bitrate (free format is not taken: its frames have no stated length).
bool ParseMP3FrameHeader(const uint8_t* h, MP3FrameHeader* header);
// Whether two headers belong to one stream.
bool SameMP3Stream(const MP3FrameHeader& a, const MP3FrameHeader& b);

// The first offset in [from, limit) where a whole frame starts that is
// followed by two more of the same stream (or by the end); -1 when there is
// none.
off64_t FindMP3Frame(const sp<DataSource>& source, off64_t from, off64_t limit, off64_t end,
                     MP3FrameHeader* header);

}  // namespace android

#endif
