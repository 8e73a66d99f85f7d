// Placeholder until the extractor lands.
#include "extractor/Sniffers.h"

namespace android {
float SniffOgg(const sp<DataSource>&) { return 0.0f; }
sp<IMediaExtractor> CreateOggExtractor(const sp<DataSource>&) { return nullptr; }
}  // namespace android
