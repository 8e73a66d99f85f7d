// The video decoding source against ffmpeg's pictures of the same files at
// the same times (recorded by tests/media/gen/video.sh), and on damaged samples.

#include <gtest/gtest.h>

#include <cmath>
#include <fstream>
#include <map>

#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaBufferBase.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/MediaExtractorFactory.h>
#include <media/stagefright/Utils.h>
#include <media/stagefright/VideoDecoderSource.h>

#include "LogCapture.h"
#include "QNMediaEditorColorUtils.h"
#include "codec/PictureConvert.h"

namespace codectest {
namespace {

using namespace android;
typedef MediaSource::ReadOptions RO;

std::string VideoPath(const std::string& file) { return std::string(ME_TEST_MEDIA_DIR) + "/video/" + file; }

sp<IMediaSource> VideoTrack(const std::string& file) {
    sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(new FileSource(VideoPath(file).c_str()));
    for (size_t i = 0; extractor != nullptr && i < extractor->countTracks(); ++i) {
        const char* mime = nullptr;
        if (extractor->getTrackMetaData(i)->findCString(kKeyMIMEType, &mime) && strncmp(mime, "video/", 6) == 0) {
            return extractor->getTrack(i);
        }
    }
    return nullptr;
}

struct Picture {
    int width = 0, height = 0;
    std::vector<uint8_t> rgb;  // 5:6:5, little-endian
};

// The decoded picture as the editor shows it: cropped, through the colour
// converter, turned by the track's rotation (clockwise).
Picture Shown(const sp<MetaData>& format, MediaBufferBase* buffer) {
    sp<AMessage> message;
    EXPECT_EQ(convertMetaDataToMessage(format, &message), OK);
    int32_t l = 0, t = 0, r = -1, b = -1, rotation = 0;
    format->findRect(kKeyCropRect, &l, &t, &r, &b);
    format->findInt32(kKeyRotation, &rotation);
    const int w = r - l + 1, h = b - t + 1;
    std::vector<uint8_t> rgb(size_t(w) * h * 2);
    sp<qnmediaeditor::QNMediaEditorColorUtils> colors = new qnmediaeditor::QNMediaEditorColorUtils();
    colors->setOutputFormat(message);
    EXPECT_EQ(colors->convert(static_cast<const uint8_t*>(buffer->data()) + buffer->range_offset(), rgb.data()), OK);
    Picture out;
    const bool quarter = rotation == 90 || rotation == 270;
    out.width = quarter ? h : w;
    out.height = quarter ? w : h;
    out.rgb.resize(rgb.size());
    for (int y = 0; y < h; ++y) {
        for (int x = 0; x < w; ++x) {
            int ox = x, oy = y;
            if (rotation == 90) ox = h - 1 - y, oy = x;
            if (rotation == 180) ox = w - 1 - x, oy = h - 1 - y;
            if (rotation == 270) ox = y, oy = w - 1 - x;
            memcpy(&out.rgb[(size_t(oy) * out.width + ox) * 2], &rgb[(size_t(y) * w + x) * 2], 2);
        }
    }
    return out;
}

// Over the channels widened to 8 bits as a PNG of the picture holds them.
double Psnr(const std::vector<uint8_t>& a, const std::vector<uint8_t>& b) {
    double sum = 0;
    size_t n = 0;
    for (size_t i = 0; i + 1 < a.size() && i + 1 < b.size(); i += 2) {
        const int pa = a[i] | a[i + 1] << 8, pb = b[i] | b[i + 1] << 8;
        for (int shift : {11, 5, 0}) {
            const int bits = shift == 5 ? 6 : 5, mask = (1 << bits) - 1;
            const int va = (pa >> shift) & mask, vb = (pb >> shift) & mask;
            const double d = ((va << (8 - bits)) | (va >> (2 * bits - 8))) - ((vb << (8 - bits)) | (vb >> (2 * bits - 8)));
            sum += d * d;
            ++n;
        }
    }
    return sum == 0 ? 99 : 10 * std::log10(255.0 * 255.0 / (sum / n));
}

struct Reference {
    int64_t timeUs;
    int width, height;
    std::string file;
};

std::map<std::string, std::vector<Reference>> References() {
    std::map<std::string, std::vector<Reference>> refs;
    std::ifstream in(VideoPath("pictures.txt"));
    std::string file;
    Reference r;
    while (in >> file >> r.timeUs >> r.width >> r.height >> r.file) refs[file].push_back(r);
    return refs;
}

std::vector<uint8_t> ReadFile(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return std::vector<uint8_t>(std::istreambuf_iterator<char>(in), {});
}

TEST(VideoDecoderSource, PicturesAtTimesMatchFfmpegs) {
    // x264 with a B-pyramid, HEVC Main 10 tagged BT.709, High 4:4:4, a turned
    // track, a cropped stream and GStreamer's file; each file's times sought
    // last first.
    const auto refs = References();
    ASSERT_EQ(refs.size(), 6u);
    for (const auto& entry : refs) {
        sp<VideoDecoderSource> decoder = VideoDecoderSource::Create(VideoTrack(entry.first));
        ASSERT_NE(decoder, nullptr) << entry.first;
        ASSERT_EQ(decoder->start(), OK);
        for (auto it = entry.second.rbegin(); it != entry.second.rend(); ++it) {
            SCOPED_TRACE(entry.first + " at " + std::to_string(it->timeUs));
            RO seek;
            seek.setSeekTo(it->timeUs, RO::SEEK_CLOSEST);
            MediaBufferBase* buffer = nullptr;
            ASSERT_EQ(decoder->read(&buffer, &seek), OK);
            int64_t t = -1;
            buffer->meta_data().findInt64(kKeyTime, &t);
            EXPECT_GE(t, it->timeUs);
            EXPECT_LT(t, it->timeUs + 40000);  // 25 pictures a second
            const Picture shown = Shown(decoder->getFormat(), buffer);
            buffer->release();
            EXPECT_EQ(shown.width, it->width);
            EXPECT_EQ(shown.height, it->height);
            EXPECT_GE(Psnr(shown.rgb, ReadFile(VideoPath(it->file))), 40.0);
        }
        EXPECT_EQ(decoder->stop(), OK);
    }
}

struct Decoded {
    status_t status = NO_INIT;
    std::vector<int64_t> timesUs;
};

Decoded DecodeAll(const sp<IMediaSource>& track) {
    Decoded run;
    sp<VideoDecoderSource> decoder = VideoDecoderSource::Create(track);
    if (decoder == nullptr || (run.status = decoder->start()) != OK) return run;
    MediaBufferBase* buffer;
    while ((run.status = decoder->read(&buffer)) == OK) {
        int64_t t = -1;
        buffer->meta_data().findInt64(kKeyTime, &t);
        run.timesUs.push_back(t);
        buffer->release();
    }
    return run;
}

size_t SampleCount(const std::string& file) {
    sp<IMediaSource> track = VideoTrack(file);
    track->start();
    size_t n = 0;
    MediaBufferBase* buffer;
    while (track->read(&buffer) == OK) buffer->release(), ++n;
    track->stop();
    return n;
}

TEST(VideoDecoderSource, EverySampleGivesOnePictureInPresentationOrder) {
    LogCapture log;
    for (const char* file : {"avc_bpyramid.mp4", "hevc_main10.mp4", "avc_444.mp4", "gst_avc.mp4"}) {
        SCOPED_TRACE(file);
        const Decoded run = DecodeAll(VideoTrack(file));
        EXPECT_EQ(run.status, ERROR_END_OF_STREAM);
        ASSERT_EQ(run.timesUs.size(), SampleCount(file));
        EXPECT_EQ(run.timesUs[0], 0);
        for (size_t i = 1; i < run.timesUs.size(); ++i) EXPECT_EQ(run.timesUs[i] - run.timesUs[i - 1], 40000);
    }
    EXPECT_FALSE(log.containsAt(ANDROID_LOG_WARN, "no picture for"));  // none held
}

TEST(VideoDecoderSource, FormatCarriesLayoutCropAndColour) {
    struct Case {
        const char* file;
        int32_t stride, sliceHeight, crop[4], matrix, rotation;
    } cases[] = {
        {"avc_cropped.mp4", 96, 64, {0, 0, 89, 57}, -1, -1},
        {"hevc_main10.mp4", 96, 64, {0, 0, 95, 63}, 1, -1},
        {"avc_rotated.mp4", 96, 64, {0, 0, 95, 63}, -1, 270},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.file);
        sp<VideoDecoderSource> decoder = VideoDecoderSource::Create(VideoTrack(c.file));
        ASSERT_NE(decoder, nullptr);
        ASSERT_EQ(decoder->start(), OK);
        const sp<MetaData> f = decoder->getFormat();
        int32_t stride = 0, slice = 0, crop[4] = {}, matrix = -1, primaries = -1, rotation = -1;
        f->findInt32(kKeyStride, &stride);
        f->findInt32(kKeySliceHeight, &slice);
        f->findRect(kKeyCropRect, &crop[0], &crop[1], &crop[2], &crop[3]);
        f->findInt32(kKeyColorMatrix, &matrix);
        f->findInt32(kKeyColorPrimaries, &primaries);
        f->findInt32(kKeyRotation, &rotation);
        EXPECT_EQ(stride, c.stride);
        EXPECT_EQ(slice, c.sliceHeight);
        EXPECT_TRUE(std::equal(crop, crop + 4, c.crop));
        EXPECT_EQ(matrix, c.matrix);
        EXPECT_EQ(primaries, c.matrix);
        EXPECT_EQ(rotation, c.rotation);
        EXPECT_EQ(decoder->stop(), OK);
    }
}

// Hands out a track's samples, damaging every fifth from the third on (or all).
class DamagedVideo : public MediaSource {
public:
    enum Damage { kBadLength, kTruncate, kGarbage, kAllGarbage, kRefused };
    DamagedVideo(const sp<IMediaSource>& track, Damage damage) : mTrack(track), mDamage(damage) {}
    status_t start(MetaData* params) override { return mTrack->start(params); }
    status_t stop() override { return mTrack->stop(); }
    sp<MetaData> getFormat() override { return mTrack->getFormat(); }
    status_t read(MediaBufferBase** buffer, const ReadOptions* options) override {
        const status_t err = mTrack->read(buffer, options);
        if (err != OK || (mDamage != kAllGarbage && (++mCount < 3 || mCount % 5 != 3))) return err;
        ++damaged;
        if (mDamage == kRefused) {  // as the MP4 track answers a sample whose units overrun it
            (*buffer)->release();
            *buffer = nullptr;
            return ERROR_MALFORMED;
        }
        uint8_t* p = static_cast<uint8_t*>((*buffer)->data()) + (*buffer)->range_offset();
        const size_t n = (*buffer)->range_length();
        switch (mDamage) {
            case kBadLength: memset(p, 0xFF, std::min<size_t>(n, 4)); break;  // a unit longer than the sample
            case kTruncate: (*buffer)->set_range((*buffer)->range_offset(), n / 3); break;
            default: for (size_t i = 0; i < n; ++i) p[i] = uint8_t(i * 151 + mCount); break;
        }
        return OK;
    }

    size_t damaged = 0;

private:
    const sp<IMediaSource> mTrack;
    const Damage mDamage;
    int mCount = 0;
};

TEST(VideoDecoderSource, DamagedSamplesAreSkippedOrHeld) {
    LogCapture log;
    for (const char* file : {"avc_bpyramid.mp4", "hevc_main10.mp4"}) {
        const size_t samples = SampleCount(file);
        for (auto damage : {DamagedVideo::kBadLength, DamagedVideo::kTruncate, DamagedVideo::kGarbage,
                            DamagedVideo::kAllGarbage, DamagedVideo::kRefused}) {
            SCOPED_TRACE(std::string(file) + " damage " + std::to_string(damage));
            sp<DamagedVideo> damaged = new DamagedVideo(VideoTrack(file), damage);
            const Decoded run = DecodeAll(damaged);
            EXPECT_EQ(run.status, ERROR_END_OF_STREAM);
            for (size_t i = 1; i < run.timesUs.size(); ++i) EXPECT_GT(run.timesUs[i], run.timesUs[i - 1]);
            // A damaged sample's place is held by the picture before it; with
            // no picture at all there is nothing to hold, and a refused one
            // has no time to hold a picture at.
            const size_t expected = damage == DamagedVideo::kAllGarbage ? 0
                                    : damage == DamagedVideo::kRefused  ? samples - damaged->damaged
                                                                        : samples;
            EXPECT_EQ(run.timesUs.size(), expected);
        }
    }
    EXPECT_TRUE(log.containsAt(ANDROID_LOG_WARN, "the picture before is held"));
    EXPECT_TRUE(log.containsAt(ANDROID_LOG_WARN, "the track refuses a video sample"));
}

TEST(PictureConvert, DeepAndFullChromaBecome8Bit420) {
    struct Case {
        int width, height, depth, shiftX, shiftY;
        std::vector<uint16_t> y, cb, cr;  // samples, rows packed
        std::vector<uint8_t> i420;
    } cases[] = {
        // Odd sizes: the last column and row repeat.
        {3, 1, 8, 1, 1, {10, 20, 30}, {100, 110}, {200, 210}, {10, 20, 30, 30, 10, 20, 30, 30, 100, 110, 200, 210}},
        // 10 bits, 4:4:4: rounded, chroma the mean of each 2x2.
        {2, 2, 10, 0, 0, {0, 1023, 514, 2}, {400, 404, 408, 412}, {0, 0, 0, 4}, {0, 255, 129, 1, 102, 0}},
        // 4:2:2: the mean of two rows.
        {2, 2, 8, 1, 0, {1, 2, 3, 4}, {10, 20}, {30, 41}, {1, 2, 3, 4, 15, 36}},
        // Grey: no chroma planes.
        {2, 2, 8, 1, 1, {9, 8, 7, 6}, {}, {}, {9, 8, 7, 6, 128, 128}},
    };
    for (const Case& c : cases) {
        std::vector<uint8_t> planes[3];
        const std::vector<uint16_t>* samples[3] = {&c.y, &c.cb, &c.cr};
        PlanarPicture in;
        for (int i = 0; i < 3; ++i) {
            for (uint16_t v : *samples[i]) {
                planes[i].push_back(uint8_t(v));
                if (c.depth > 8) planes[i].push_back(uint8_t(v >> 8));
            }
            const int w = i == 0 ? c.width : (c.width + c.shiftX) >> c.shiftX;
            in.planes[i] = samples[i]->empty() ? nullptr : planes[i].data();
            in.pitch[i] = w * (c.depth > 8 ? 2 : 1);
        }
        in.width = c.width, in.height = c.height, in.bitDepth = c.depth;
        in.chromaShiftX = c.shiftX, in.chromaShiftY = c.shiftY;
        std::vector<uint8_t> out(c.i420.size(), 0xEE);
        ToI420(in, out.data());
        EXPECT_EQ(out, c.i420) << c.width << "x" << c.height << " depth " << c.depth;
    }
}

}  // namespace
}  // namespace codectest
