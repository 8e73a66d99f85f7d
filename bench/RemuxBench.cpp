// Copies every sample of every track of an MP4 into a new MP4, the way the
// editor writes a trimmed recording: samples read in time order, copied
// into buffers of their own and pushed into one MediaAdapter per track,
// which the MP4 writer's readers drain to the file. The input comes from
// make_bench_mp4.sh; remux_bench.sh runs this beside ffmpeg and cp.

#include <benchmark/benchmark.h>

#include <fcntl.h>
#include <sys/resource.h>
#include <unistd.h>

#include <cstdlib>
#include <cstring>
#include <vector>

#include <media/stagefright/FileSource.h>
#include <media/stagefright/MPEG4Writer.h>
#include <media/stagefright/MediaAdapter.h>
#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/MediaExtractorFactory.h>

using namespace android;

namespace {

const char* EnvOr(const char* name, const char* fallback) {
    const char* value = getenv(name);
    return value != nullptr ? value : fallback;
}

struct Track {
    sp<IMediaSource> source;
    sp<MediaAdapter> adapter;
    MediaBufferBase* sample = nullptr;
    int64_t timeUs = 0;
};

bool Fill(Track* t) {
    t->sample = nullptr;
    if (t->source->read(&t->sample) != OK) return false;
    t->sample->meta_data().findInt64(kKeyTime, &t->timeUs);
    return true;
}

// A copy of the sample with its times and marks, as the muxer pushes it.
MediaBuffer* Copy(MediaBufferBase* in) {
    MediaBuffer* out = new MediaBuffer(in->range_length());
    memcpy(out->data(), static_cast<const uint8_t*>(in->data()) + in->range_offset(), in->range_length());
    MetaDataBase& from = in->meta_data();
    MetaDataBase& to = out->meta_data();
    int64_t time = 0;
    int32_t flag = 0;
    if (from.findInt64(kKeyTime, &time)) to.setInt64(kKeyTime, time);
    if (from.findInt64(kKeyDecodingTime, &time)) to.setInt64(kKeyDecodingTime, time);
    if (from.findInt32(kKeyIsSyncFrame, &flag) && flag) to.setInt32(kKeyIsSyncFrame, 1);
    out->add_ref();
    return out;
}

bool RemuxAll(const char* in, const char* out, size_t* samples, size_t* bytes) {
    sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(new FileSource(in), nullptr);
    if (extractor == nullptr) return false;
    const int fd = open(out, O_CREAT | O_TRUNC | O_RDWR, 0644);
    if (fd < 0) return false;
    sp<MPEG4Writer> writer = new MPEG4Writer(fd);
    std::vector<Track> tracks(extractor->countTracks());
    for (size_t i = 0; i < tracks.size(); ++i) {
        tracks[i].source = extractor->getTrack(i);
        tracks[i].adapter = new MediaAdapter(extractor->getTrackMetaData(i));
        writer->addSource(tracks[i].adapter);
        tracks[i].source->start();
        Fill(&tracks[i]);
    }
    sp<MetaData> params = new MetaData;
    params->setInt32(kKeyRealTimeRecording, 0);
    bool ok = writer->start(params.get()) == OK;
    while (ok) {
        Track* next = nullptr;
        for (Track& t : tracks) {
            if (t.sample != nullptr && (next == nullptr || t.timeUs < next->timeUs)) next = &t;
        }
        if (next == nullptr) break;
        ++*samples;
        *bytes += next->sample->range_length();
        ok = next->adapter->pushBuffer(Copy(next->sample)) == OK;
        next->sample->release();
        Fill(next);
    }
    for (Track& t : tracks) {
        if (t.sample != nullptr) t.sample->release();
        t.adapter->stop();
        t.source->stop();
    }
    ok = writer->stop() == OK && ok;
    close(fd);
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
