#ifndef TESTS_MPEG4_TEST_SUPPORT_H
#define TESTS_MPEG4_TEST_SUPPORT_H

// Helpers for the MP4 writer tests: synthetic sources pushed through
// MediaAdapters the way the muxer does, ffprobe output as key/value pairs,
// and small real H.264/HEVC/AAC streams made with ffmpeg at test time.

#include <cstdint>
#include <functional>
#include <map>
#include <string>
#include <vector>

#include <media/stagefright/MPEG4Writer.h>
#include <media/stagefright/MetaData.h>

namespace mp4test {

struct Pushed {
    size_t track;
    std::vector<uint8_t> bytes;
    int64_t ptsUs;
    int64_t dtsUs;
    bool sync;
    bool config;
};

// Adds one MediaAdapter per format, starts the writer, pushes the samples
// from one thread in the given order (as the muxer does), stops the
// adapters, then the writer. `beforeStart` may set file items.
struct WriteResult {
    android::status_t addSource = android::OK;
    android::status_t start = android::OK;
    android::status_t stop = android::OK;
};
WriteResult writeThroughAdapters(const android::sp<android::MPEG4Writer>& writer,
                                 const std::vector<android::sp<android::MetaData>>& formats,
                                 const std::vector<Pushed>& samples, android::MetaData* startParams = nullptr,
                                 const std::function<void()>& afterStart = nullptr);

bool haveTool(const char* name);
// A fresh directory for this test's files.
std::string tempDir();
int runCommand(const std::string& command, std::string* output = nullptr);

// `ffprobe -of flat` output as key -> value (quotes removed).
using Flat = std::map<std::string, std::string>;
bool probe(const std::string& path, const std::string& entries, Flat* out);
// Decodes the whole file; the error text is empty when nothing went wrong.
bool decodesCleanly(const std::string& path, std::string* errors);
int64_t parseSecondsToUs(const std::string& text);

// A packet as ffprobe reports it.
struct Packet {
    int stream;
    int64_t ptsUs;
    int64_t dtsUs;
    size_t size;
    int64_t pos;
    bool key;
};
std::vector<Packet> packets(const std::string& path);
std::vector<uint8_t> readFile(const std::string& path, int64_t offset = 0, size_t size = SIZE_MAX);
std::vector<uint8_t> extradata(const std::string& path, int stream);

// Length-prefixed (4 bytes) <-> Annex-B, for building test input.
std::vector<uint8_t> toAnnexB(const std::vector<uint8_t>& lengthPrefixed);
// The parameter sets of an avcC or hvcC record as one Annex-B buffer.
std::vector<uint8_t> recordToAnnexB(const std::vector<uint8_t>& record, bool hevc);

// Source material: packets of an ffmpeg-made file as samples of tracks
// 0.. (its streams in order), with the stream's codec config as the
// first, config-flagged sample when `configBuffers` is set.
std::vector<Pushed> samplesOf(const std::string& path, bool annexB, bool configBuffers);

// The children of the first box of `type` on `path` (e.g. "moov/udta").
std::map<std::string, std::vector<uint8_t>> childBoxes(const std::vector<uint8_t>& file, const std::string& path);

}  // namespace mp4test

#endif
