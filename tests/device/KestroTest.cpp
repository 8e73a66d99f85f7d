#include <gtest/gtest.h>

#include <cstdlib>
#include <thread>

#include <kestro/Kestro.h>

#include "LogCapture.h"
#include "writers/AudioWriterTestSupport.h"

using namespace android;

namespace {

const char kSection[] = "NewFeatures";

// Points the store at a file of this text for the test's lifetime.
class SettingsFile {
public:
    explicit SettingsFile(const std::string& contents) : mFile(".ini") { write(contents); }
    ~SettingsFile() {
        unsetenv("KESTRO_SETTINGS");
        Kestro::getInstance()->setSettingsPath(nullptr);
    }
    void write(const std::string& contents) {
        writertest::writeFile(mFile.path(), writertest::Bytes(contents.begin(), contents.end()));
    }
    const std::string& path() const { return mFile.path(); }

private:
    writertest::ScratchFile mFile;
};

}  // namespace

TEST(KestroTest, ReadsTheSettingsFile) {
    SettingsFile file(
        "; media editor settings\n"
        "  # another comment\n"
        "top = outside any section\n"
        "[ NewFeatures ]\n"
        "  mediaeditor_audio_bgmsync =  -40  \r\n"
        "mediaeditor_use_dither_type=\"2\"\n"
        "not a setting\n"
        "empty =\n"
        "[Other]\n"
        "mediaeditor_audio_bgmsync = 7\n"
        "[NewFeatures]\n"
        "empty = later wins\n");
    Kestro* store = Kestro::getInstance();
    ASSERT_NE(nullptr, store);
    LogCapture logs;
    store->setSettingsPath(file.path().c_str());
    EXPECT_TRUE(logs.containsAt(ANDROID_LOG_WARN, ":7: not a setting"));
    EXPECT_EQ(nullptr, store->getFeatureInfo(1));
    KestroFeatureInfo* info = store->getFeatureInfo(2);
    ASSERT_NE(nullptr, info);
    ASSERT_NE(nullptr, info->getFeatureValue(kSection, SETTING_MEDIAEDITOR_AUDIO_BGMSYNC));
    EXPECT_STREQ("-40", info->getFeatureValue(kSection, SETTING_MEDIAEDITOR_AUDIO_BGMSYNC));
    EXPECT_STREQ("2", info->getFeatureValue(kSection, SETTING_MEDIAEDITOR_USE_DITHER_TYPE));
    EXPECT_STREQ("later wins", info->getFeatureValue(kSection, "empty"));
    EXPECT_STREQ("7", info->getFeatureValue("Other", SETTING_MEDIAEDITOR_AUDIO_BGMSYNC));
    EXPECT_STREQ("outside any section", info->getFeatureValue("", "top"));
    EXPECT_EQ(nullptr, info->getFeatureValue(kSection, "not a setting"));
    EXPECT_EQ(nullptr, info->getFeatureValue("newfeatures", SETTING_MEDIAEDITOR_AUDIO_BGMSYNC));
    EXPECT_EQ(nullptr, info->getFeatureValue(nullptr, "x"));
}

TEST(KestroTest, PathFromTheEnvironmentAndAbsentFiles) {
    SettingsFile file("[NewFeatures]\nmediaeditor_use_dither_type = 1\n");
    Kestro* store = Kestro::getInstance();
    setenv("KESTRO_SETTINGS", file.path().c_str(), 1);
    store->setSettingsPath(nullptr);
    EXPECT_EQ(file.path(), store->settingsPath());
    EXPECT_STREQ("1", store->getFeatureInfo(2)->getFeatureValue(kSection, SETTING_MEDIAEDITOR_USE_DITHER_TYPE));

    store->setSettingsPath((file.path() + ".missing").c_str());
    EXPECT_EQ(nullptr, store->getFeatureInfo(2)->getFeatureValue(kSection, SETTING_MEDIAEDITOR_USE_DITHER_TYPE));

    unsetenv("KESTRO_SETTINGS");
    store->setSettingsPath(nullptr);
    EXPECT_EQ("/etc/kestro/settings.ini", store->settingsPath());
}

TEST(KestroTest, ValuesStayPutUntilTheyChange) {
    SettingsFile file("[NewFeatures]\na = 1\nb = 2\n");
    Kestro* store = Kestro::getInstance();
    store->setSettingsPath(file.path().c_str());
    KestroFeatureInfo* info = store->getFeatureInfo(2);
    const char* a = info->getFeatureValue(kSection, "a");
    ASSERT_NE(nullptr, a);

    // Other keys come and go, the file is read again: "a" keeps its text.
    info->setFeatureValue(kSection, "c", "3");
    file.write("[NewFeatures]\na = 1\nb = changed\n");
    store->reload();
    EXPECT_EQ(a, info->getFeatureValue(kSection, "a"));
    EXPECT_STREQ("1", a);
    EXPECT_STREQ("changed", info->getFeatureValue(kSection, "b"));
    EXPECT_EQ(nullptr, info->getFeatureValue(kSection, "c"));

    info->setFeatureValue(kSection, "a", "9");
    EXPECT_STREQ("9", info->getFeatureValue(kSection, "a"));
    info->setFeatureValue(kSection, "a", nullptr);
    EXPECT_EQ(nullptr, info->getFeatureValue(kSection, "a"));
    info->clear();
    EXPECT_EQ(nullptr, info->getFeatureValue(kSection, "b"));
}

TEST(KestroConcurrencyTest, ReadersAndWriters) {
    SettingsFile file("[NewFeatures]\nstable = yes\n");
    Kestro* store = Kestro::getInstance();
    store->setSettingsPath(file.path().c_str());
    KestroFeatureInfo* info = store->getFeatureInfo(2);
    std::thread writer([info] {
        for (int i = 0; i < 2000; ++i) info->setFeatureValue(kSection, "counter", std::to_string(i).c_str());
    });
    int seen = 0;
    for (int i = 0; i < 2000; ++i) {
        const char* v = info->getFeatureValue(kSection, "stable");
        seen += v != nullptr && std::string(v) == "yes";
    }
    writer.join();
    EXPECT_EQ(2000, seen);
    EXPECT_STREQ("1999", info->getFeatureValue(kSection, "counter"));
}
