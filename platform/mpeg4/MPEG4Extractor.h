#ifndef MPEG4_EXTRACTOR_H_
#define MPEG4_EXTRACTOR_H_

#include <memory>
#include <vector>

#include <media/stagefright/DataSource.h>
#include <media/stagefright/MediaExtractor.h>

#include "mpeg4/MPEG4Box.h"
#include "mpeg4/MPEG4Fragments.h"
#include "mpeg4/MPEG4Track.h"
#include "mpeg4/MPEG4UserData.h"

namespace android {

// ISO base media files (mp4, m4a, 3gp): the index ('moov', before or after
// the media data) is read once, with every movie fragment ('moof') after it,
// so that seeking needs no further reads of the index; tracks of codecs not
// handed out are left out.
class MPEG4Extractor : public MediaExtractor {
public:
    explicit MPEG4Extractor(const sp<DataSource>& source);

    // OK when the file has at least one usable track.
    status_t initCheck() const { return mInitCheck; }

    size_t countTracks() override;
    sp<IMediaSource> getTrack(size_t index) override;
    sp<MetaData> getTrackMetaData(size_t index, uint32_t flags = 0) override;
    sp<MetaData> getMetaData() override;
    const char* name() override { return "MPEG4Extractor"; }

protected:
    ~MPEG4Extractor() override = default;

private:
    status_t readFile();
    status_t readMovie(const ByteReader& moov);
    status_t readFragments(const std::vector<std::pair<off64_t, mpeg4::BoxHeader>>& fragments);
    status_t finishTracks();
    void readSphereView(off64_t offset, uint64_t size);

    const sp<DataSource> mDataSource;
    off64_t mFileSize = 0;
    uint32_t mMovieTimescale = 0;
    sp<MetaData> mFileMeta = new MetaData;
    std::vector<std::shared_ptr<mpeg4::Track>> mTracks;
    std::unique_ptr<mpeg4::FragmentReader> mFragments;  // for a movie with an 'mvex'
    DeviceItems mItems;
    status_t mInitCheck;
};

}  // namespace android

#endif
