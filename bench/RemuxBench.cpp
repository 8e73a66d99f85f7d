// Copies every sample of every track of an MP4 into a new MP4 the way the
// editor service does: the extractor wrapper reads the samples in time
// order, the muxer pushes each into its track's MediaAdapter and the MP4
// writer's readers drain them to the file. The input comes from
// make_bench_mp4.sh; remux_bench.sh runs this beside ffmpeg and cp.

#include <benchmark/benchmark.h>

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>

#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/MetaData.h>

#include "QNMediaExtractorWrapper.h"
#include "QNMediaMuxer.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace {

const char* EnvOr(const char* name, const char* fallback) {
    const char* value = getenv(name);
    return value != nullptr ? value : fallback;
}

bool RemuxAll(const char* in, const char* out, size_t* samples, size_t* bytes) {
    const int inFd = open(in, O_RDONLY);
    const int outFd = open(out, O_CREAT | O_TRUNC | O_RDWR, 0644);
    struct stat st;
    bool ok = inFd >= 0 && outFd >= 0 && fstat(inFd, &st) == 0;
    sp<QNMediaExtractorWrapper> extractor = new QNMediaExtractorWrapper;
    ok = ok && extractor->setDataSource(inFd, 0, st.st_size) == OK;
    sp<QNMediaMuxer> muxer = new QNMediaMuxer(outFd, OUTPUT_FILE_FORMAT_MPEG_4);
    for (size_t i = 0; ok && i < extractor->countTracks(); ++i) {
        sp<AMessage> format;
        ok = extractor->getTrackFormat(i, &format) == OK && muxer->addTrack(format) == int32_t(i) &&
             extractor->selectTrack(i) == OK;
    }
    ok = ok && muxer->start() == OK;
    size_t track = 0;
    int64_t timeUs = 0;
    while (ok && extractor->getSampleTrackIndex(&track) == OK) {
        sp<ABuffer> sample;
        sp<MetaData> meta;
        int32_t sync = 0;
        ok = extractor->getSampleTime(&timeUs) == OK && extractor->getSampleMeta(&meta) == OK &&
             extractor->readSampleData(&sample) == OK;
        if (!ok) break;
        const uint32_t flags = meta->findInt32(kKeyIsSyncFrame, &sync) && sync ? 1 : 0;
        ++*samples;
        *bytes += sample->size();
        ok = muxer->writeSampleData(0, sample, uint32_t(track), timeUs, flags) == OK && extractor->advance() == OK;
    }
    ok = muxer->stop() == OK && ok;
    muxer.clear();
    extractor.clear();
    if (inFd >= 0) close(inFd);
    if (outFd >= 0) close(outFd);
    return ok;
}

void BM_RemuxEverySample(benchmark::State& state) {
    const char* in = EnvOr("REMUX_BENCH_FILE", "/tmp/mediaeditor_demux_bench.mp4");
    const char* out = EnvOr("REMUX_BENCH_OUT", "/tmp/mediaeditor_remux_bench_out.mp4");
    size_t samples = 0, bytes = 0;
    for (auto _ : state) {
        samples = bytes = 0;
        if (!RemuxAll(in, out, &samples, &bytes)) {
            state.SkipWithError("remux failed: run bench/make_bench_mp4.sh first");
            return;
        }
    }
    struct rusage usage;
    getrusage(RUSAGE_SELF, &usage);
    state.counters["samples"] = double(samples);
    state.counters["peak_rss_mb"] = usage.ru_maxrss / 1024.0;
    state.SetBytesProcessed(int64_t(bytes) * state.iterations());
}
BENCHMARK(BM_RemuxEverySample)->Unit(benchmark::kMillisecond)->UseRealTime();

}  // namespace

BENCHMARK_MAIN();
