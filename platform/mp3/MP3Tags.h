#ifndef PLATFORM_MP3_MP3_TAGS_H_
#define PLATFORM_MP3_MP3_TAGS_H_

#include <cstddef>
#include <cstdint>

#include <media/stagefright/DataSource.h>

#include "mp3/MP3FrameHeader.h"

namespace android {

// What an encoder's first frame (Xing/Info with LAME's extension, or VBRI)
// says about the stream. That frame carries no audio.
struct MP3StreamInfo {
    uint64_t frames = 0;   // audio frames; 0 when not stated
    int32_t delay = -1;    // encoder delay and padding in samples; -1 when not stated
    int32_t padding = -1;
};

// False when the frame is an ordinary audio frame.
bool ReadMP3InfoFrame(const uint8_t* frame, size_t size, const MP3FrameHeader& header, MP3StreamInfo* info);

// Where the audio ends in a file of `size` bytes: before an ID3v1 tag and an
// APE tag (with or without its header) at the end.
off64_t MP3AudioEnd(const sp<DataSource>& source, off64_t size);

}  // namespace android

#endif
