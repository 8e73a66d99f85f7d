// Placeholder until the extractor lands.
#include "extractor/Sniffers.h"

namespace android {
float SniffAMR(const sp<DataSource>&) { return 0.0f; }
sp<IMediaExtractor> CreateAMRExtractor(const sp<DataSource>&) { return nullptr; }
}  // namespace android
