// Placeholder until the settings store lands.
#include <kestro/Kestro.h>

namespace android {
const char* SETTING_MEDIAEDITOR_AUDIO_BGMSYNC = "mediaeditor_audio_bgmsync";
const char* SETTING_MEDIAEDITOR_USE_DITHER_TYPE = "mediaeditor_use_dither_type";
const char* KestroFeatureInfo::getFeatureValue(const char*, const char*) { return nullptr; }
void KestroFeatureInfo::setFeatureValue(const char*, const char*, const char*) {}
void KestroFeatureInfo::removeFeatureValue(const char*, const char*) {}
void KestroFeatureInfo::clear() {}
Kestro::Kestro() {}
Kestro* Kestro::getInstance() { static Kestro k; return &k; }
KestroFeatureInfo* Kestro::getFeatureInfo(int kind) { return kind == 2 ? &mMediaFeatures : nullptr; }
void Kestro::reload() {}
void Kestro::setSettingsPath(const char*) {}
}  // namespace android
