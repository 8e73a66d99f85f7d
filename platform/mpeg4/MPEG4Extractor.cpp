// Placeholder until the extractor lands.
#include "extractor/Sniffers.h"

namespace android {
float SniffMPEG4(const sp<DataSource>&) { return 0.0f; }
sp<IMediaExtractor> CreateMPEG4Extractor(const sp<DataSource>&) { return nullptr; }
}  // namespace android
