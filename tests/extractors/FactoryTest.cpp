#include <gtest/gtest.h>

#include <cstring>

#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaExtractorFactory.h>

#include "extractors/AudioMediaFacts.h"

using namespace android;
using namespace audiotest;

namespace {

std::string ContainerOf(const sp<IMediaExtractor>& extractor) {
    const char* mime = nullptr;
    sp<MetaData> meta = extractor->getMetaData();
    return meta != nullptr && meta->findCString(kKeyMIMEType, &mime) ? mime : "";
}

}  // namespace

TEST(MediaExtractorFactoryTest, ChoosesTheExtractorByContent) {
    struct Case {
        const char* file;
        const char* container;
    };
    for (const Case& c : {Case{"s16_stereo.wav", MEDIA_MIMETYPE_CONTAINER_WAV},
                          Case{"b1152.flac", MEDIA_MIMETYPE_CONTAINER_FLAC},
                          Case{"nb.amr", MEDIA_MIMETYPE_CONTAINER_AMR}, Case{"wb.awb", MEDIA_MIMETYPE_CONTAINER_AMR},
                          Case{"mono.ogg", MEDIA_MIMETYPE_CONTAINER_OGG}}) {
        SCOPED_TRACE(c.file);
        sp<IMediaExtractor> fromFile = MediaExtractorFactory::Create(OpenMedia(c.file), nullptr);
        ASSERT_NE(fromFile, nullptr);
        EXPECT_EQ(ContainerOf(fromFile), c.container);
        EXPECT_EQ(fromFile->countTracks(), 1u);
        // The same bytes without any name.
        sp<IMediaExtractor> fromMemory = MediaExtractorFactory::Create(MemorySource(ReadFile(c.file)), nullptr);
        ASSERT_NE(fromMemory, nullptr);
        EXPECT_STREQ(fromMemory->name(), fromFile->name());
    }
}

TEST(MediaExtractorFactoryTest, AnswersNullWhenNothingAccepts) {
    EXPECT_EQ(MediaExtractorFactory::Create(nullptr, nullptr), nullptr);
    EXPECT_EQ(MediaExtractorFactory::Create(MemorySource({}), nullptr), nullptr);
    std::vector<uint8_t> noise(4096);
    for (size_t i = 0; i < noise.size(); ++i) noise[i] = static_cast<uint8_t>(i * 7 + 3);
    EXPECT_EQ(MediaExtractorFactory::Create(MemorySource(noise), nullptr), nullptr);
    // Sniffed as WAVE, but without the chunks the extractor needs.
    const uint8_t riff[] = {'R', 'I', 'F', 'F', 4, 0, 0, 0, 'W', 'A', 'V', 'E'};
    EXPECT_EQ(MediaExtractorFactory::Create(MemorySource(std::vector<uint8_t>(riff, riff + sizeof(riff))), nullptr),
              nullptr);
    // A source that cannot be read.
    EXPECT_EQ(MediaExtractorFactory::Create(new FileSource(-1, 0, 0), nullptr), nullptr);
}
