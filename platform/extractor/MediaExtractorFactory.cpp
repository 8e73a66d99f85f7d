#define LOG_TAG "MediaExtractorFactory"
#include <media/stagefright/MediaExtractorFactory.h>

#include <media/stagefright/ExtractorRefusal.h>

#include <log/log.h>

#include "extractor/Sniffers.h"
#include "extractor/UnsupportedFormats.h"

namespace android {

namespace {
const ExtractorDef kExtractors[] = {
    {"MPEG4", SniffMPEG4, CreateMPEG4Extractor},
    {"WAV", SniffWAV, CreateWAVExtractor},
    {"FLAC", SniffFLAC, CreateFLACExtractor},
    {"AMR", SniffAMR, CreateAMRExtractor},
    {"Ogg", SniffOgg, CreateOggExtractor},
    {"MP3", SniffMP3, CreateMP3Extractor},
};
}  // namespace

sp<IMediaExtractor> MediaExtractorFactory::Create(const sp<DataSource>& source, const char* /*mime*/) {
    clearRefusalReason();
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
        const char* format = NameUnsupportedFormat(source);
        if (format != nullptr && peekRefusalReason().empty()) setRefusalReason("%s is not supported", format);
        ALOGW("no extractor recognises the data%s%s", format ? ": " : "", format ? format : "");
        return nullptr;
    }
    ALOGV("sniffed %s (confidence %.2f)", best->name, bestConfidence);
    sp<IMediaExtractor> extractor = best->create(source);
    if (extractor == nullptr) {
        ALOGW("%s extractor could not parse the data", best->name);
    } else {
        clearRefusalReason();
    }
    return extractor;
}

}  // namespace android
