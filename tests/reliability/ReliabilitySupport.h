#ifndef TESTS_RELIABILITY_SUPPORT_H
#define TESTS_RELIABILITY_SUPPORT_H

#include <dirent.h>

#include <algorithm>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include <log/log.h>

namespace reliability {

using Bytes = std::vector<uint8_t>;

// Drops every log line while alive: thousands of refusals say nothing here.
class QuietLogs {
public:
    QuietLogs() { mPrevious = android::setLogSink([](int, const char*, const char*) {}); }
    ~QuietLogs() { android::setLogSink(mPrevious); }

private:
    android::LogSink mPrevious;
};

inline Bytes readFile(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return Bytes(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

// Names in a directory (no dot files), sorted; empty when it does not exist.
inline std::vector<std::string> listDir(const std::string& dir) {
    std::vector<std::string> names;
    if (DIR* d = opendir(dir.c_str())) {
        while (dirent* e = readdir(d)) {
            if (e->d_name[0] != '.') names.push_back(e->d_name);
        }
        closedir(d);
    }
    std::sort(names.begin(), names.end());
    return names;
}

struct SampleFile {
    std::string name;
    std::string path;
    Bytes bytes;
    bool flac;
};

// Every media file under tests/media, of every container the extractors know.
inline std::vector<SampleFile> sampleFiles() {
    std::vector<SampleFile> files;
    for (const char* dir : {"audio", "mp4"}) {
        const std::string path = std::string(ME_TEST_MEDIA_DIR) + "/" + dir;
        for (const std::string& name : listDir(path)) {
            const size_t dot = name.rfind('.');
            const std::string ext = dot == std::string::npos ? "" : name.substr(dot);
            // Fragmented MP4: one file per layout (these repeat another's).
            if (name == "frag_dash.mp4" || name == "frag_hevc.mp4") continue;
            if (ext == ".wav" || ext == ".flac" || ext == ".ogg" || ext == ".amr" || ext == ".awb" || ext == ".mp4" ||
                ext == ".mov" || ext == ".m4a" || ext == ".3gp") {
                files.push_back({name, path + "/" + name, readFile(path + "/" + name), ext == ".flac"});
            }
        }
    }
    // Other producers' variants (RF64, pipe-written and G.711 WAVE, tagged
    // FLAC, chained Ogg), one of each kind.
    const std::string foreign = std::string(ME_TEST_MEDIA_DIR) + "/foreign/";
    for (const char* name : {"rf64.wav", "pipe.wav", "alaw.wav", "id3.flac", "chain_same.ogg", "chain_rate.ogg"}) {
        files.push_back({name, foreign + name, readFile(foreign + name), std::string(name) == "id3.flac"});
    }
    return files;
}

inline std::string regressionsDir() { return std::string(ME_TEST_MEDIA_DIR) + "/../fuzz-regressions"; }

}  // namespace reliability

#endif
