#ifndef PLATFORM_EXTRACTOR_SNIFFERS_H_
#define PLATFORM_EXTRACTOR_SNIFFERS_H_

#include <media/IMediaExtractor.h>
#include <media/stagefright/DataSource.h>

namespace android {

// One entry per container: a sniffer that looks at the content (never the
// name) and answers a confidence in 0..1 (0: not this format), and a
// constructor that answers null when the file cannot be parsed.
struct ExtractorDef {
    const char* name;
    float (*sniff)(const sp<DataSource>& source);
    sp<IMediaExtractor> (*create)(const sp<DataSource>& source);
};

float SniffMPEG4(const sp<DataSource>& source);
sp<IMediaExtractor> CreateMPEG4Extractor(const sp<DataSource>& source);
float SniffWAV(const sp<DataSource>& source);
sp<IMediaExtractor> CreateWAVExtractor(const sp<DataSource>& source);
float SniffFLAC(const sp<DataSource>& source);
sp<IMediaExtractor> CreateFLACExtractor(const sp<DataSource>& source);
float SniffAMR(const sp<DataSource>& source);
sp<IMediaExtractor> CreateAMRExtractor(const sp<DataSource>& source);
float SniffOgg(const sp<DataSource>& source);
sp<IMediaExtractor> CreateOggExtractor(const sp<DataSource>& source);
float SniffMP3(const sp<DataSource>& source);
sp<IMediaExtractor> CreateMP3Extractor(const sp<DataSource>& source);

}  // namespace android

#endif
