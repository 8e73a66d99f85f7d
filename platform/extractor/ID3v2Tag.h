#ifndef PLATFORM_EXTRACTOR_ID3V2_TAG_H_
#define PLATFORM_EXTRACTOR_ID3V2_TAG_H_

#include <media/stagefright/DataSource.h>

namespace android {

// Where the data starts after the ID3v2 tags (if any) at `offset`: tagging
// tools put them in front of FLAC and MP3 streams. A tag whose header is not
// valid ends the skipping there.
off64_t SkipID3v2Tags(const sp<DataSource>& source, off64_t offset);

}  // namespace android

#endif
