#ifndef ANDROID_KESTRO_H
#define ANDROID_KESTRO_H

#include <map>
#include <mutex>
#include <string>

namespace android {

// Keys of the media-editor settings in the section "NewFeatures".
extern const char* SETTING_MEDIAEDITOR_AUDIO_BGMSYNC;
extern const char* SETTING_MEDIAEDITOR_USE_DITHER_TYPE;

// Feature values by section and key, as text.
class KestroFeatureInfo {
public:
    // Null when the store has no value for the key. The text stays valid
    // until the value is set again.
    const char* getFeatureValue(const char* section, const char* key);
    void setFeatureValue(const char* section, const char* key, const char* value);
    void removeFeatureValue(const char* section, const char* key);
    void clear();
    // Takes these values in place of the current ones; values that do not
    // change keep their text (and pointers to it stay valid).
    void replaceAll(const std::map<std::string, std::map<std::string, std::string>>& values);

private:
    std::mutex mLock;
    std::map<std::string, std::map<std::string, std::string>> mValues;
};

// The device's settings store. Values come from a settings file (see
// Kestro.cpp for its path and format); an absent file means no values.
class Kestro {
public:
    static Kestro* getInstance();
    // The feature-information object of a kind; 2 is the media features.
    // Owned by the store; null for other kinds.
    KestroFeatureInfo* getFeatureInfo(int kind);

    // Reads the settings file again (tests and tools).
    void reload();
    // Reads another settings file instead (tests); null goes back to the
    // default path.
    void setSettingsPath(const char* path);
    // The file the values come from.
    std::string settingsPath();

private:
    Kestro();
    std::mutex mLock;
    std::string mPath;
    KestroFeatureInfo mMediaFeatures;
};

}  // namespace android

#endif
