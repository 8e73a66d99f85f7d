#define LOG_TAG "Kestro"
#include <kestro/Kestro.h>

#include <cstdlib>
#include <fstream>
#include <sstream>

#include <log/log.h>

// The settings file: the path in the environment variable KESTRO_SETTINGS
// when it is set and not empty, else /etc/kestro/settings.ini. A missing or
// unreadable file means no values. Format:
//
//   ; comment (also "#")
//   [NewFeatures]
//   mediaeditor_audio_bgmsync = -40
//   mediaeditor_use_dither_type = 1
//
// Section and key names are matched exactly; blanks around names and values
// are dropped, as are double quotes around a whole value. A line that is
// neither a section, a key = value pair, a comment nor blank is skipped with
// a warning. A later value of the same key replaces an earlier one.

namespace android {

const char* SETTING_MEDIAEDITOR_AUDIO_BGMSYNC = "mediaeditor_audio_bgmsync";
const char* SETTING_MEDIAEDITOR_USE_DITHER_TYPE = "mediaeditor_use_dither_type";

namespace {

using Values = std::map<std::string, std::map<std::string, std::string>>;

const char kDefaultPath[] = "/etc/kestro/settings.ini";
const char kPathVariable[] = "KESTRO_SETTINGS";
constexpr std::streamoff kMaxFileBytes = 1 << 20;
constexpr int kMediaFeatures = 2;

std::string trim(const std::string& s) {
    const size_t begin = s.find_first_not_of(" \t\r\n");
    if (begin == std::string::npos) return std::string();
    const size_t end = s.find_last_not_of(" \t\r\n");
    return s.substr(begin, end - begin + 1);
}

std::string defaultPath() {
    const char* fromEnv = getenv(kPathVariable);
    return fromEnv != nullptr && fromEnv[0] != '\0' ? fromEnv : kDefaultPath;
}

Values parseSettings(std::istream& in, const std::string& path) {
    Values values;
    std::string section, line;
    int number = 0;
    while (std::getline(in, line)) {
        ++number;
        const std::string text = trim(line);
        if (text.empty() || text[0] == ';' || text[0] == '#') continue;
        if (text.front() == '[' && text.back() == ']') {
            section = trim(text.substr(1, text.size() - 2));
            continue;
        }
        const size_t equals = text.find('=');
        if (equals == std::string::npos || equals == 0) {
            ALOGW("%s:%d: not a setting, skipped", path.c_str(), number);
            continue;
        }
        std::string value = trim(text.substr(equals + 1));
        if (value.size() >= 2 && value.front() == '"' && value.back() == '"') value = value.substr(1, value.size() - 2);
        values[section][trim(text.substr(0, equals))] = value;
    }
    return values;
}

Values loadSettings(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        ALOGD("no settings file at %s", path.c_str());
        return Values();
    }
    file.seekg(0, std::ios::end);
    const std::streamoff size = file.tellg();
    if (size < 0 || size > kMaxFileBytes) {
        ALOGE("settings file %s is unreadable or too large; no values", path.c_str());
        return Values();
    }
    file.seekg(0, std::ios::beg);
    return parseSettings(file, path);
}

}  // namespace

const char* KestroFeatureInfo::getFeatureValue(const char* section, const char* key) {
    if (section == nullptr || key == nullptr) return nullptr;
    std::lock_guard<std::mutex> lock(mLock);
    const auto s = mValues.find(section);
    if (s == mValues.end()) return nullptr;
    const auto k = s->second.find(key);
    // Map nodes do not move, so the text stays where it is until replaced.
    return k == s->second.end() ? nullptr : k->second.c_str();
}

void KestroFeatureInfo::setFeatureValue(const char* section, const char* key, const char* value) {
    if (section == nullptr || key == nullptr) return;
    if (value == nullptr) {
        removeFeatureValue(section, key);
        return;
    }
    std::lock_guard<std::mutex> lock(mLock);
    mValues[section][key] = value;
}

void KestroFeatureInfo::removeFeatureValue(const char* section, const char* key) {
    if (section == nullptr || key == nullptr) return;
    std::lock_guard<std::mutex> lock(mLock);
    const auto s = mValues.find(section);
    if (s == mValues.end()) return;
    s->second.erase(key);
    if (s->second.empty()) mValues.erase(s);
}

void KestroFeatureInfo::clear() {
    std::lock_guard<std::mutex> lock(mLock);
    mValues.clear();
}

void KestroFeatureInfo::replaceAll(const Values& values) {
    std::lock_guard<std::mutex> lock(mLock);
    for (auto s = mValues.begin(); s != mValues.end();) {
        const auto incoming = values.find(s->first);
        if (incoming == values.end()) {
            s = mValues.erase(s);
            continue;
        }
        for (auto k = s->second.begin(); k != s->second.end();) {
            k = incoming->second.count(k->first) ? std::next(k) : s->second.erase(k);
        }
        ++s;
    }
    for (const auto& [section, keys] : values) {
        auto& target = mValues[section];
        for (const auto& [key, value] : keys) {
            auto it = target.find(key);
            if (it == target.end()) {
                target.emplace(key, value);
            } else if (it->second != value) {
                it->second = value;
            }
        }
    }
}

Kestro::Kestro() : mPath(defaultPath()) { mMediaFeatures.replaceAll(loadSettings(mPath)); }

Kestro* Kestro::getInstance() {
    static Kestro instance;
    return &instance;
}

KestroFeatureInfo* Kestro::getFeatureInfo(int kind) { return kind == kMediaFeatures ? &mMediaFeatures : nullptr; }

void Kestro::reload() {
    std::lock_guard<std::mutex> lock(mLock);
    mMediaFeatures.replaceAll(loadSettings(mPath));
}

void Kestro::setSettingsPath(const char* path) {
    std::lock_guard<std::mutex> lock(mLock);
    mPath = path != nullptr ? path : defaultPath();
    mMediaFeatures.replaceAll(loadSettings(mPath));
}

std::string Kestro::settingsPath() {
    std::lock_guard<std::mutex> lock(mLock);
    return mPath;
}

}  // namespace android
