// Reads every sample of every track of an MP4 in presentation order, the way
// the editor demuxes a recording: through the extractor wrapper, and through
// the platform extractor alone for reference. The input comes from
// make_bench_mp4.sh; demux_bench.sh runs this beside ffmpeg on the same file.

#include <benchmark/benchmark.h>

#include <fcntl.h>
#include <sys/resource.h>
#include <unistd.h>

#include <cstdlib>
#include <vector>

#include <QNMediaExtractorWrapper.h>

#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaBufferBase.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/MediaExtractorFactory.h>
#include <media/stagefright/foundation/ABuffer.h>

using namespace android;
using android::qnmediaeditor::QNMediaExtractorWrapper;

namespace {

const char* BenchFile() {
    const char* path = getenv("DEMUX_BENCH_FILE");
    return path != nullptr ? path : "/tmp/mediaeditor_demux_bench.mp4";
}

struct Pending {
    sp<IMediaSource> source;
    MediaBufferBase* sample = nullptr;
    int64_t timeUs = 0;
};

bool Fill(Pending* p) {
    if (p->source->read(&p->sample) != OK) return false;
    p->sample->meta_data().findInt64(kKeyTime, &p->timeUs);
    return true;
}

// The earliest pending sample across the tracks goes first, one held per track.
bool DemuxThroughExtractor(const char* path, size_t* samples, size_t* bytes) {
    sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(new FileSource(path), nullptr);
    if (extractor == nullptr) return false;
    std::vector<Pending> tracks(extractor->countTracks());
    for (size_t i = 0; i < tracks.size(); ++i) {
        tracks[i].source = extractor->getTrack(i);
        tracks[i].source->start();
        if (!Fill(&tracks[i])) tracks[i].sample = nullptr;
    }
    while (true) {
        Pending* next = nullptr;
        for (Pending& t : tracks) {
            if (t.sample != nullptr && (next == nullptr || t.timeUs < next->timeUs)) next = &t;
        }
        if (next == nullptr) break;
        ++*samples;
        *bytes += next->sample->range_length();
        next->sample->release();
        next->sample = nullptr;
        Fill(next);
    }
    for (Pending& t : tracks) t.source->stop();
    return true;
}

// As the editor does: every track selected, each sample copied into one
// reused buffer that grows when a sample does not fit.
bool DemuxThroughWrapper(const char* path, size_t* samples, size_t* bytes) {
    const int fd = open(path, O_RDONLY | O_CLOEXEC);
    if (fd < 0) return false;
    sp<QNMediaExtractorWrapper> wrapper = new QNMediaExtractorWrapper;
    const status_t err = wrapper->setDataSource(fd, 0, lseek(fd, 0, SEEK_END));
    close(fd);
    if (err != OK) return false;
    for (size_t i = 0; i < wrapper->countTracks(); ++i) wrapper->selectTrack(i);
    sp<ABuffer> buffer = new ABuffer(1 << 20);
    while (true) {
        status_t read = wrapper->readSampleData(buffer);
        if (read == NO_MEMORY) {
            buffer = new ABuffer(buffer->capacity() * 2);
            continue;
        }
        if (read != OK) break;
        ++*samples;
        *bytes += buffer->size();
        wrapper->advance();
    }
    return true;
}

template <bool (*Demux)(const char*, size_t*, size_t*)>
void BM_DemuxEverySample(benchmark::State& state) {
    size_t samples = 0, bytes = 0;
    for (auto _ : state) {
        samples = bytes = 0;
        if (!Demux(BenchFile(), &samples, &bytes)) {
            state.SkipWithError("no readable input: run bench/make_bench_mp4.sh first");
            return;
        }
    }
    struct rusage usage;
    getrusage(RUSAGE_SELF, &usage);
    state.counters["samples"] = double(samples);
    state.counters["peak_rss_mb"] = usage.ru_maxrss / 1024.0;
    state.SetBytesProcessed(int64_t(bytes) * state.iterations());
}
BENCHMARK_TEMPLATE(BM_DemuxEverySample, DemuxThroughWrapper)->Name("Wrapper")->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK_TEMPLATE(BM_DemuxEverySample, DemuxThroughExtractor)->Name("Extractor")->Unit(benchmark::kMillisecond)->UseRealTime();

}  // namespace

BENCHMARK_MAIN();
