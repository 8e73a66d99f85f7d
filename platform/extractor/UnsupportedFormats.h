#ifndef PLATFORM_EXTRACTOR_UNSUPPORTED_FORMATS_H_
#define PLATFORM_EXTRACTOR_UNSUPPORTED_FORMATS_H_

#include <media/stagefright/DataSource.h>

namespace android {

// Names common formats that no extractor reads ("AIFF", "Matroska/WebM"), so
// that a refusal says what the file is; null for data it does not know.
const char* NameUnsupportedFormat(const sp<DataSource>& source);

}  // namespace android

#endif
