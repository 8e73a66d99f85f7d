#define LOG_TAG "MediaExtractorFactory"
#include <media/stagefright/MediaExtractorFactory.h>

#include <log/log.h>

#include "extractor/Sniffers.h"

namespace android {

namespace {
const ExtractorDef kExtractors[] = {
    {"MPEG4", SniffMPEG4, CreateMPEG4Extractor},
    {"WAV", SniffWAV, CreateWAVExtractor},
    {"FLAC", SniffFLAC, CreateFLACExtractor},
    {"AMR", SniffAMR, CreateAMRExtractor},
    {"Ogg", SniffOgg, CreateOggExtractor},
};
}  // namespace

sp<IMediaExtractor> MediaExtractorFactory::Create(const sp<DataSource>& source, const char* /*mime*/) {
    if (source == nullptr || source->initCheck() != OK) return nullptr;
    const ExtractorDef* best = nullptr;
    float bestConfidence = 0.0f;
    for (const ExtractorDef& def : kExtractors) {
        const float confidence = def.sniff(source);
        if (confidence > bestConfidence) {
            bestConfidence = confidence;
            best = &def;
        }
    }
    if (best == nullptr) {
        ALOGW("no extractor recognises the data");
        return nullptr;
    }
    ALOGV("sniffed %s (confidence %.2f)", best->name, bestConfidence);
    sp<IMediaExtractor> extractor = best->create(source);
    if (extractor == nullptr) ALOGW("%s extractor could not parse the data", best->name);
    return extractor;
}

}  // namespace android
