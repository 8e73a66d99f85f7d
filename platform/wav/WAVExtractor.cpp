// Placeholder until the extractor lands.
#include "extractor/Sniffers.h"

namespace android {
float SniffWAV(const sp<DataSource>&) { return 0.0f; }
sp<IMediaExtractor> CreateWAVExtractor(const sp<DataSource>&) { return nullptr; }
}  // namespace android
