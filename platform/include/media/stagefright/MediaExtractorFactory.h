#ifndef MEDIA_EXTRACTOR_FACTORY_H_
#define MEDIA_EXTRACTOR_FACTORY_H_

#include <media/IMediaExtractor.h>
#include <media/stagefright/DataSource.h>

namespace android {

class MediaExtractorFactory {
public:
    // Chooses an extractor by sniffing the content (never by name); null when
    // none accepts it or the one chosen cannot parse the file. A MIME hint,
    // when given, is tried first.
    static sp<IMediaExtractor> Create(const sp<DataSource>& source, const char* mime = nullptr);
};

}  // namespace android

#endif
