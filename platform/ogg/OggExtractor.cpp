#define LOG_TAG "OggExtractor"
#include "ogg/OggExtractor.h"

#include <cstring>
#include <new>

#include <log/log.h>
#include <media/stagefright/ExtractorRefusal.h>
#include <media/stagefright/MediaDefs.h>

#include "extractor/SeekPolicy.h"
#include "extractor/Sniffers.h"
#include "ogg/OggSource.h"
#include "ogg/OggVorbisStream.h"

namespace android {

sp<OggExtractor> OggExtractor::Create(const sp<DataSource>& source) {
    std::shared_ptr<VorbisHeaders> headers(new (std::nothrow) VorbisHeaders);
    if (headers == nullptr || headers->read(source) != OK) return nullptr;
    std::shared_ptr<const OggChain> chain = OggChain::Scan(source, *headers);
    if (chain == nullptr) return nullptr;
    return new OggExtractor(source, headers, chain);
}

OggExtractor::OggExtractor(const sp<DataSource>& source, const std::shared_ptr<const VorbisHeaders>& headers,
                           const std::shared_ptr<const OggChain>& chain)
    : SingleTrackExtractor(MEDIA_MIMETYPE_CONTAINER_OGG), mSource(source), mHeaders(headers), mChain(chain) {
    MetaData* t = mTrackMeta.get();
    t->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_VORBIS);
    t->setInt32(kKeySampleRate, static_cast<int32_t>(headers->sampleRate()));
    t->setInt32(kKeyChannelCount, headers->channels());
    t->setData(kKeyVorbisInfo, 0, headers->identification().data(), headers->identification().size());
    t->setData(kKeyVorbisBooks, 0, headers->setup().data(), headers->setup().size());
    t->setInt32(kKeyMaxInputSize, static_cast<int32_t>(OggVorbisStream::kMaxPacketBytes));
    const int64_t last = chain->totalSamples();
    int64_t durationUs = 0;
    if (last > 0) {
        durationUs = TicksToUs(static_cast<uint64_t>(last), headers->sampleRate()) + chain->unreadUs();
        t->setInt64(kKeyDuration, durationUs);
    }
    off64_t size;
    if (headers->nominalBitrate() > 0 && headers->nominalBitrate() <= INT32_MAX) {
        t->setInt32(kKeyBitRate, static_cast<int32_t>(headers->nominalBitrate()));
    } else if (durationUs > 0 && source->getSize(&size) == OK && size > 0) {
        const int64_t bitrate = static_cast<int64_t>(static_cast<__int128>(size) * 8000000 / durationUs);
        if (bitrate <= INT32_MAX) t->setInt32(kKeyBitRate, static_cast<int32_t>(bitrate));
    }
}

sp<IMediaSource> OggExtractor::createTrack() { return new OggSource(mSource, mHeaders, mChain, mTrackMeta); }

float SniffOgg(const sp<DataSource>& source) {
    // The first page, and the Vorbis identification header at the start of
    // its first packet (the page has at most 255 lacing values).
    uint8_t head[27 + 255 + 7];
    const ssize_t n = source->readAt(0, head, sizeof(head));
    if (n < 27 || memcmp(head, "OggS", 4) != 0) return 0.0f;
    const size_t body = 27 + head[26];
    if (static_cast<size_t>(n) < body + 7) return 0.0f;
    if (memcmp(head + body, "\x01vorbis", 7) == 0) return 0.8f;
    // Other codecs' first packets start with their own magic.
    static const struct {
        const char* magic;
        size_t length;
        const char* name;
    } kOthers[] = {{"\x7f" "FLAC", 5, "FLAC"},   {"OpusHead", 8, "Opus"}, {"Speex   ", 8, "Speex"},
                   {"\x80theora", 7, "Theora video"}, {"fishead", 7, "a Skeleton index first"}};
    const char* name = "an unknown codec";
    for (const auto& other : kOthers) {
        if (static_cast<size_t>(n) >= body + other.length && memcmp(head + body, other.magic, other.length) == 0) {
            name = other.name;
        }
    }
    setRefusalReason("Ogg stream holds %s, which is not supported", name);
    return 0.0f;
}

sp<IMediaExtractor> CreateOggExtractor(const sp<DataSource>& source) {
    return OggExtractor::Create(source);
}

}  // namespace android
