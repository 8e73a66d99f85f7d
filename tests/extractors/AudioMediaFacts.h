#ifndef TESTS_EXTRACTORS_AUDIO_MEDIA_FACTS_H
#define TESTS_EXTRACTORS_AUDIO_MEDIA_FACTS_H

// Shared by the audio extractor tests: the sample files, the facts recorded
// about them by tests/media/gen/audio.sh, and reading a track to its end.

#include <cstdint>
#include <cstdlib>
#include <fstream>
#include <functional>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include <media/IMediaExtractor.h>
#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaErrors.h>

namespace audiotest {

using namespace android;

// "name" is a file of audio/; "dir/name" one of another media directory.
inline std::string MediaPath(const std::string& name) {
    return std::string(ME_TEST_MEDIA_DIR) + (name.find('/') == std::string::npos ? "/audio/" : "/") + name;
}

inline std::vector<uint8_t> ReadFile(const std::string& name) {
    std::ifstream in(MediaPath(name), std::ios::binary);
    return std::vector<uint8_t>((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
}

inline sp<DataSource> OpenMedia(const std::string& name) { return new FileSource(MediaPath(name).c_str()); }

inline sp<DataSource> MemorySource(const std::vector<uint8_t>& bytes) {
    return new BufferDataSource(bytes.data(), bytes.size());
}

// "<file> <key> <value>" lines of the facts.txt beside the file.
inline std::string Fact(const std::string& file, const std::string& key) {
    const size_t slash = file.rfind('/');
    const std::string dir = slash == std::string::npos ? "" : file.substr(0, slash + 1);
    std::ifstream in(MediaPath(dir + "facts.txt"));
    std::string line;
    while (std::getline(in, line)) {
        std::istringstream fields(line);
        std::string f, k, v;
        fields >> f >> k;
        std::getline(fields >> std::ws, v);
        if (dir + f == file && k == key) return v;
    }
    return "";
}
inline int64_t FactInt(const std::string& file, const std::string& key) {
    return std::strtoll(Fact(file, key).c_str(), nullptr, 10);
}

struct Packet {
    int64_t pts;
    int64_t duration;
    size_t size;
};
inline std::vector<Packet> Packets(const std::string& file) {
    std::ifstream in(MediaPath(file + ".packets"));
    std::vector<Packet> out;
    std::string line;
    while (std::getline(in, line)) {
        if (line.empty()) continue;
        Packet p{};
        if (sscanf(line.c_str(), "%lld,%lld,%zu", reinterpret_cast<long long*>(&p.pts),
                   reinterpret_cast<long long*>(&p.duration), &p.size) == 3) {
            out.push_back(p);
        }
    }
    return out;
}

inline uint64_t Fnv(const std::vector<uint8_t>& bytes, uint64_t h = 0xcbf29ce484222325ull) {
    for (uint8_t b : bytes) h = (h ^ b) * 0x100000001b3ull;
    return h;
}
inline std::string Hex64(uint64_t v) {
    char b[17];
    snprintf(b, sizeof(b), "%016llx", static_cast<unsigned long long>(v));
    return b;
}

struct Sample {
    std::vector<uint8_t> bytes;
    int64_t timeUs = -1;
    int32_t sync = 0;
    bool hasValid = false;
    int32_t valid = 0;
};

// Reads until an error; at most `limit` samples. The first read may seek.
inline status_t ReadSamples(const sp<IMediaSource>& source, std::vector<Sample>* out, size_t limit = 1000000,
                            const MediaTrack::ReadOptions* first = nullptr) {
    status_t err = OK;
    for (size_t i = 0; i < limit; ++i) {
        MediaBufferBase* buffer = nullptr;
        err = source->read(&buffer, i == 0 ? first : nullptr);
        if (err != OK) {
            if (buffer != nullptr) return UNKNOWN_ERROR;  // broken contract
            return err;
        }
        Sample s;
        const uint8_t* p = static_cast<const uint8_t*>(buffer->data()) + buffer->range_offset();
        s.bytes.assign(p, p + buffer->range_length());
        buffer->meta_data().findInt64(kKeyTime, &s.timeUs);
        buffer->meta_data().findInt32(kKeyIsSyncFrame, &s.sync);
        s.hasValid = buffer->meta_data().findInt32(kKeyValidSamples, &s.valid);
        buffer->release();
        out->push_back(std::move(s));
    }
    return err;
}

inline std::vector<uint8_t> Concat(const std::vector<Sample>& samples) {
    std::vector<uint8_t> all;
    for (const Sample& s : samples) all.insert(all.end(), s.bytes.begin(), s.bytes.end());
    return all;
}

// Opens prefixes of `bytes` and copies with one byte changed: at every offset
// below `dense`, then every `step` bytes. Each either fails to open or reads
// to an error status; the sanitizers catch what goes wrong underneath.
inline void ExerciseHostileCopies(const std::vector<uint8_t>& bytes, size_t dense, size_t step,
                                  const std::function<sp<IMediaExtractor>(const sp<DataSource>&)>& create,
                                  const std::function<void(IMediaExtractor*)>& prepare = nullptr) {
    auto exercise = [&](const std::vector<uint8_t>& copy) {
        sp<IMediaExtractor> extractor = create(MemorySource(copy));
        if (extractor == nullptr) return;
        if (prepare) prepare(extractor.get());
        extractor->getMetaData();
        for (size_t t = 0; t < extractor->countTracks(); ++t) {
            sp<IMediaSource> track = extractor->getTrack(t);
            if (track == nullptr || track->start() != OK) continue;
            std::vector<Sample> samples;
            ReadSamples(track, &samples, 100000);
            MediaTrack::ReadOptions seek;
            seek.setSeekTo(300000, MediaTrack::ReadOptions::SEEK_CLOSEST);
            samples.clear();
            ReadSamples(track, &samples, 4, &seek);
            track->stop();
        }
    };
    auto next = [&](size_t at) { return at < dense ? at + 1 : at + step; };
    for (size_t n = 0; n < bytes.size(); n = next(n)) {
        exercise(std::vector<uint8_t>(bytes.begin(), bytes.begin() + n));
    }
    for (size_t at = 0; at < bytes.size(); at = next(at)) {
        std::vector<uint8_t> copy = bytes;
        copy[at] ^= 0x5A;
        exercise(copy);
    }
}

}  // namespace audiotest

#endif
