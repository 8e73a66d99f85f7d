#ifndef TESTS_AUDIO_WRITER_TEST_SUPPORT_H
#define TESTS_AUDIO_WRITER_TEST_SUPPORT_H

// Shared by the WAVE, FLAC and AMR writer tests: a scratch file, a source the
// writer pulls from (the muxer's adapter), and the command-line checkers.

#include <fcntl.h>
#include <sys/resource.h>
#include <unistd.h>

#include <csignal>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include <media/IMediaExtractor.h>
#include <media/stagefright/MediaAdapter.h>
#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MetaData.h>

#include "extractor/DeviceKeys.h"
#include "extractors/AudioMediaFacts.h"

namespace writertest {

using Bytes = std::vector<uint8_t>;

// A file in the temporary directory, removed with the object; fd is open for
// reading and writing.
class ScratchFile {
public:
    explicit ScratchFile(const char* suffix = "") {
        const char* dir = getenv("TMPDIR");
        mPath = std::string(dir && *dir ? dir : "/tmp") + "/writertest-XXXXXX" + suffix;
        std::vector<char> name(mPath.begin(), mPath.end());
        name.push_back('\0');
        fd = mkstemps(name.data(), static_cast<int>(strlen(suffix)));
        mPath = name.data();
    }
    ~ScratchFile() {
        if (fd >= 0) close(fd);
        unlink(mPath.c_str());
    }
    const std::string& path() const { return mPath; }
    Bytes bytes() const;
    int fd = -1;

private:
    std::string mPath;
};

// While it lives, writes that would take a file past `bytes` fail with EFBIG
// instead of raising the signal, as on a file system that has run out.
class FileSizeCap {
public:
    explicit FileSizeCap(rlim_t bytes) {
        mPrevious = signal(SIGXFSZ, SIG_IGN);
        mSet = getrlimit(RLIMIT_FSIZE, &mSaved) == 0;
        struct rlimit small = mSaved;
        small.rlim_cur = bytes;
        mSet = mSet && setrlimit(RLIMIT_FSIZE, &small) == 0;
    }
    ~FileSizeCap() {
        if (mSet) setrlimit(RLIMIT_FSIZE, &mSaved);
        signal(SIGXFSZ, mPrevious);
    }
    bool active() const { return mSet; }

private:
    struct rlimit mSaved;
    void (*mPrevious)(int);
    bool mSet;
};

inline android::sp<android::MediaAdapter> makeSource(const android::sp<android::MetaData>& format) {
    return new android::MediaAdapter(format);
}

// Pushes one sample the way the muxer does (the adapter takes the reference).
inline android::status_t push(const android::sp<android::MediaAdapter>& source, const uint8_t* data, size_t size,
                              int64_t timeUs = 0, bool codecConfig = false) {
    auto* buffer = new android::MediaBuffer(size);
    if (size > 0) memcpy(buffer->data(), data, size);
    buffer->meta_data().setInt64(android::kKeyTime, timeUs);
    if (codecConfig) buffer->meta_data().setInt32(android::kKeyIsCodecConfig, 1);
    buffer->add_ref();
    return source->pushBuffer(buffer);
}

inline android::status_t push(const android::sp<android::MediaAdapter>& source, const Bytes& bytes,
                              int64_t timeUs = 0, bool codecConfig = false) {
    return push(source, bytes.data(), bytes.size(), timeUs, codecConfig);
}

// Pushes `bytes` in pieces of `piece` bytes.
inline void pushInPieces(const android::sp<android::MediaAdapter>& source, const Bytes& bytes, size_t piece) {
    for (size_t pos = 0; pos < bytes.size(); pos += piece) {
        push(source, bytes.data() + pos, std::min(piece, bytes.size() - pos));
    }
}

inline bool haveTool(const char* name) {
    const std::string command = std::string("command -v ") + name + " >/dev/null 2>&1";
    return system(command.c_str()) == 0;
}

// Runs a shell command; its exit status, and what it printed on stdout.
inline int run(const std::string& command, std::string* output = nullptr) {
    FILE* pipe = popen((command + " 2>/dev/null").c_str(), "r");
    if (pipe == nullptr) return -1;
    std::string text;
    char chunk[4096];
    size_t n;
    while ((n = fread(chunk, 1, sizeof(chunk), pipe)) > 0) text.append(chunk, n);
    const int status = pclose(pipe);
    if (output != nullptr) *output = text;
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

inline Bytes readFile(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return Bytes(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

inline Bytes ScratchFile::bytes() const { return readFile(mPath); }

inline void writeFile(const std::string& path, const Bytes& bytes) {
    std::ofstream out(path, std::ios::binary);
    out.write(reinterpret_cast<const char*>(bytes.data()), static_cast<std::streamsize>(bytes.size()));
}

// Interleaved 16-bit little-endian tones, a different pitch per channel.
inline Bytes tone16(int channels, int frames) {
    Bytes out;
    out.reserve(static_cast<size_t>(frames) * channels * 2);
    uint32_t noise = 12345;
    for (int i = 0; i < frames; ++i) {
        for (int c = 0; c < channels; ++c) {
            // A sawtooth plus a little noise: compressible but not trivial.
            noise = noise * 1103515245u + 12345u;
            const int period = 50 + 17 * c;
            const int v = ((i % period) * 20000 / period) - 10000 + int((noise >> 16) & 0xFF) - 128;
            out.push_back(uint8_t(v));
            out.push_back(uint8_t(v >> 8));
        }
    }
    return out;
}

// What an extractor publishes of the device's items ("" / 0 when absent).
struct PublishedItems {
    Bytes waveform;
    std::string userMessage, recMode;
    int64_t bookmarkSize = 0;
};

inline PublishedItems publishedItems(const android::sp<android::IMediaExtractor>& extractor) {
    PublishedItems items;
    android::sp<android::MetaData> meta = extractor->getMetaData();
    const void* data;
    size_t size;
    uint32_t type;
    if (meta->findData(android::kKeyDeviceWaveForm, &type, &data, &size)) {
        items.waveform.assign(static_cast<const uint8_t*>(data), static_cast<const uint8_t*>(data) + size);
    }
    const char* text;
    if (meta->findCString(android::kKeyDeviceUserMessage, &text)) items.userMessage = text;
    if (meta->findCString(android::kKeyDeviceRecMode, &text)) items.recMode = text;
    extractor->getTrackMetaData(0)->findInt64(android::kKeyDeviceBookmarkSize, &items.bookmarkSize);
    return items;
}

// Every sample of the extractor's first track, up to the end of the stream.
inline std::vector<audiotest::Sample> readTrack(const android::sp<android::IMediaExtractor>& extractor) {
    std::vector<audiotest::Sample> samples;
    android::sp<android::IMediaSource> track = extractor->getTrack(0);
    if (track == nullptr || track->start() != android::OK) return samples;
    const android::status_t err = audiotest::ReadSamples(track, &samples);
    track->stop();
    if (err != android::ERROR_END_OF_STREAM) samples.clear();
    return samples;
}

inline uint32_t le32(const uint8_t* p) { return p[0] | (p[1] << 8) | (p[2] << 16) | (uint32_t(p[3]) << 24); }
inline uint16_t le16(const uint8_t* p) { return uint16_t(p[0] | (p[1] << 8)); }
inline uint32_t be24(const uint8_t* p) { return (p[0] << 16) | (p[1] << 8) | p[2]; }

}  // namespace writertest

#endif
