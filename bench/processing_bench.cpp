// Audio and picture processing speed, with the ratios against their baselines
// printed at the end of the run.
#include <benchmark/benchmark.h>

#include <libyuv/convert_argb.h>
#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>

#include <cstdio>
#include <cstring>
#include <map>
#include <random>
#include <string>
#include <vector>

#include "QNMediaAudioConverter.h"
#include "QNMediaAudioEffect.h"
#include "QNMediaAudioWaveForm.h"
#include "QNMediaEditorColorUtils.h"
#include "QNMediaFlacFrameConverter.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace {

std::vector<uint8_t> randomBytes(size_t n, uint32_t seed) {
    std::mt19937 rng(seed);
    std::vector<uint8_t> b(n);
    for (size_t i = 0; i + 4 <= n; i += 4) {
        const uint32_t r = rng();
        memcpy(&b[i], &r, 4);
    }
    return b;
}

// ~100 MB of fixed-block-size frames: 4096 stereo 16-bit samples, verbatim-sized bodies.
const std::vector<sp<ABuffer>>& flacFrames() {
    static std::vector<sp<ABuffer>> frames = [] {
        std::vector<sp<ABuffer>> v;
        const size_t kBody = 4096 * 4 + 7;
        const std::vector<uint8_t> body = randomBytes(kBody, 1);
        sp<AMessage> none;
        sp<QNMediaFlacFrameConverter> coder = new QNMediaFlacFrameConverter(none);
        for (uint64_t n = 0; n * kBody < 100u << 20; ++n) {
            uint8_t head[16] = {0xFF, 0xF8, 0xC9, 0x18};
            uint32_t codeSize = 0;
            coder->makeUTF8UCS2(n, head + 4, &codeSize, 0);
            const uint32_t headSize = 4 + codeSize;
            head[headSize] = QNMediaFlacFrameConverter::crc8(head, headSize);
            sp<ABuffer> f = new ABuffer(headSize + 1 + kBody + 2);
            memcpy(f->data(), head, headSize + 1);
            memcpy(f->data() + headSize + 1, body.data(), kBody);
            const uint16_t crc = QNMediaFlacFrameConverter::crc16Sliced(f->data(), f->size() - 2);
            f->data()[f->size() - 2] = crc >> 8;
            f->data()[f->size() - 1] = crc & 0xFF;
            f->meta()->setInt64("timeUs", static_cast<int64_t>(n) * 92880);
            v.push_back(f);
        }
        return v;
    }();
    return frames;
}

size_t flacBytes() {
    size_t n = 0;
    for (const auto& f : flacFrames()) n += f->size();
    return n;
}

void BM_FlacConvert(benchmark::State& state) {
    const auto& frames = flacFrames();
    for (auto _ : state) {
        sp<AMessage> none;
        sp<QNMediaFlacFrameConverter> conv = new QNMediaFlacFrameConverter(none);
        for (sp<ABuffer> f : frames) {
            sp<ABuffer> out;
            if (!conv->convert(f, &out)) state.SkipWithError("convert failed");
            benchmark::DoNotOptimize(out->data());
        }
    }
    state.SetBytesProcessed(state.iterations() * flacBytes());
}
BENCHMARK(BM_FlacConvert)->Unit(benchmark::kMillisecond);

void BM_FlacMemcpy(benchmark::State& state) {
    const auto& frames = flacFrames();
    std::vector<uint8_t> dst(frames[0]->size() + 16);
    for (auto _ : state) {
        for (const sp<ABuffer>& f : frames) {
            memcpy(dst.data(), f->data(), f->size());
            benchmark::ClobberMemory();
        }
    }
    state.SetBytesProcessed(state.iterations() * flacBytes());
}
BENCHMARK(BM_FlacMemcpy)->Unit(benchmark::kMillisecond);

// One minute of 48 kHz 16-bit stereo, in buffers of 4096 frames.
const std::vector<sp<ABuffer>>& pcmBuffers() {
    static std::vector<sp<ABuffer>> buffers = [] {
        std::vector<sp<ABuffer>> v;
        const std::vector<uint8_t> pcm = randomBytes(48000 * 60 * 4, 2);
        for (size_t pos = 0; pos < pcm.size(); pos += 4096 * 4) {
            v.push_back(ABuffer::CreateAsCopy(pcm.data() + pos, std::min<size_t>(4096 * 4, pcm.size() - pos)));
        }
        return v;
    }();
    return buffers;
}

void BM_WaveForm16Stereo(benchmark::State& state) {
    const auto& buffers = pcmBuffers();
    sp<AMessage> format = new AMessage;
    format->setInt32("channel-count", 2);
    format->setInt32("bits-per-sample", 16);
    format->setInt32("sample-rate", 48000);
    for (auto _ : state) {
        state.PauseTiming();
        sp<QNMediaAudioWaveForm> w = new QNMediaAudioWaveForm;
        w->init(format);
        state.ResumeTiming();
        for (sp<ABuffer> b : buffers) w->addSample(b);
        benchmark::DoNotOptimize(w.get());
    }
}
BENCHMARK(BM_WaveForm16Stereo)->Unit(benchmark::kMillisecond);

void BM_WaveFormMemcpy(benchmark::State& state) {
    const auto& buffers = pcmBuffers();
    std::vector<uint8_t> dst(4096 * 4);
    for (auto _ : state) {
        for (const sp<ABuffer>& b : buffers) {
            memcpy(dst.data(), b->data(), b->size());
            benchmark::ClobberMemory();
        }
    }
}
BENCHMARK(BM_WaveFormMemcpy)->Unit(benchmark::kMillisecond);

constexpr int kWidth = 1920, kHeight = 1080, kSliceHeight = 1088;

const std::vector<uint8_t>& nv12Frame() {
    static const std::vector<uint8_t> frame = randomBytes(kWidth * kSliceHeight * 3 / 2, 3);
    return frame;
}

void BM_ColorUtilsNV12ToRGB565(benchmark::State& state) {
    sp<AMessage> format = new AMessage;
    format->setInt32("width", kWidth);
    format->setInt32("height", kHeight);
    format->setInt32("stride", kWidth);
    format->setInt32("slice-height", kSliceHeight);
    format->setInt32("color-format", 21);
    sp<QNMediaEditorColorUtils> cu = new QNMediaEditorColorUtils;
    cu->setOutputFormat(format);
    std::vector<uint8_t> out(kWidth * kHeight * 2);
    for (auto _ : state) {
        if (cu->convert(nv12Frame().data(), out.data()) != OK) state.SkipWithError("convert failed");
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_ColorUtilsNV12ToRGB565)->Unit(benchmark::kMillisecond);

void BM_LibyuvNV12ToRGB565(benchmark::State& state) {
    std::vector<uint8_t> out(kWidth * kHeight * 2);
    const uint8_t* y = nv12Frame().data();
    for (auto _ : state) {
        libyuv::NV12ToRGB565Matrix(y, kWidth, y + kWidth * kSliceHeight, kWidth, out.data(), kWidth * 2,
                                   &libyuv::kYuvI601Constants, kWidth, kHeight);
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_LibyuvNV12ToRGB565)->Unit(benchmark::kMillisecond);

constexpr int kBlockFrames = 480;  // 10 ms at 48 kHz
constexpr int kBlocks = 1000;      // 10 s of audio per iteration

void BM_MixerStereo48k(benchmark::State& state) {
    const std::vector<uint8_t> main = randomBytes(kBlockFrames * 4, 4), aux = randomBytes(kBlockFrames * 4, 5);
    std::vector<uint8_t> out(main.size()), in = main, auxCopy = aux;
    sp<QNMediaAudioEffect> e = new QNMediaAudioEffect;
    e->setParamAudioInfo(16, 48000, 2);
    e->setParamAuxInfo(16, 48000, 2);
    e->setParamChainType(-3, -3, 0, 4);
    for (auto _ : state) {
        for (int i = 0; i < kBlocks; ++i) {
            e->writeAux(auxCopy.data(), static_cast<int>(auxCopy.size()));
            e->processEffectChain(in.data(), out.data(), static_cast<int>(in.size()));
        }
        benchmark::ClobberMemory();
    }
    state.counters["x_realtime"] = benchmark::Counter(kBlocks * 0.01 * state.iterations(), benchmark::Counter::kIsRate);
}
BENCHMARK(BM_MixerStereo48k)->Unit(benchmark::kMillisecond);

void BM_Converter44kTo48kStereo(benchmark::State& state) {
    const int inFrames = 441;  // 10 ms at 44.1 kHz
    std::vector<uint8_t> in = randomBytes(inFrames * 4, 6);
    sp<QNMediaAudioConverter> c = new QNMediaAudioConverter;
    c->init(44100, 2, 16, 48000, 2, 16);
    unsigned char* out = c->allocateBuff(nullptr, static_cast<int>(in.size()), 1.0f);
    for (auto _ : state) {
        for (int i = 0; i < kBlocks; ++i) benchmark::DoNotOptimize(c->process(in.data(), out, static_cast<int>(in.size())));
    }
    c->freeBuff(out);
    state.counters["x_realtime"] = benchmark::Counter(kBlocks * 0.01 * state.iterations(), benchmark::Counter::kIsRate);
}
BENCHMARK(BM_Converter44kTo48kStereo)->Unit(benchmark::kMillisecond);

// Keeps each benchmark's time per iteration and its real-time counter for the ratios.
class RatioReporter : public benchmark::ConsoleReporter {
public:
    void ReportRuns(const std::vector<Run>& runs) override {
        ConsoleReporter::ReportRuns(runs);
        for (const Run& r : runs) {
            if (r.run_type != Run::RT_Iteration) continue;
            time[r.benchmark_name()] = r.GetAdjustedCPUTime();  // the machine may be shared
            auto it = r.counters.find("x_realtime");
            if (it != r.counters.end()) realtime[r.benchmark_name()] = it->second.value;
        }
    }
    std::map<std::string, double> time, realtime;
};

}  // namespace

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    RatioReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    auto ratio = [&](const char* what, const char* a, const char* b, const char* goal) {
        if (reporter.time.count(a) && reporter.time.count(b) && reporter.time[b] > 0) {
            printf("%-44s %6.2f  (%s)\n", what, reporter.time[a] / reporter.time[b], goal);
        }
    };
    printf("\nRatios of this run (CPU time):\n");
    ratio("FLAC convert / memcpy", "BM_FlacConvert", "BM_FlacMemcpy", "goal <= 3");
    ratio("waveform 16-bit stereo / memcpy", "BM_WaveForm16Stereo", "BM_WaveFormMemcpy", "goal <= 4");
    ratio("colour utils NV12->RGB565 / libyuv", "BM_ColorUtilsNV12ToRGB565", "BM_LibyuvNV12ToRGB565", "goal <= 1.3");
    for (const auto& rt : reporter.realtime) printf("%-44s %6.0fx real time (goal >= 200)\n", rt.first.c_str(), rt.second);
    benchmark::Shutdown();
    return 0;
}
