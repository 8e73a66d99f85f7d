// Placeholder until the extractor lands.
#include "extractor/Sniffers.h"

namespace android {
float SniffFLAC(const sp<DataSource>&) { return 0.0f; }
sp<IMediaExtractor> CreateFLACExtractor(const sp<DataSource>&) { return nullptr; }
}  // namespace android
