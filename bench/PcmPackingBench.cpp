// 24-bit packing of a 16 MB buffer against copying the same bytes.
#include <cstring>
#include <random>
#include <vector>

#include "BenchRatio.h"
#include "QNMediaEditorUtils.h"

using android::qnmediaeditor::QNMediaEditorUtils;

namespace {

constexpr size_t kBytes = 16 << 20;
constexpr int kSamples = kBytes / 4;

std::vector<uint32_t> randomWords() {
    std::vector<uint32_t> words(kSamples);
    std::mt19937 rng(1);
    for (uint32_t& w : words) w = rng();
    return words;
}

std::vector<float> randomFloats() {
    std::vector<float> floats(kSamples);
    std::mt19937 rng(2);
    std::uniform_real_distribution<float> dist(-1.05f, 1.05f);  // a few clip
    for (float& f : floats) f = dist(rng);
    return floats;
}

void BM_Memcpy(benchmark::State& state) {
    std::vector<uint8_t> src(kBytes, 1), dst(kBytes);
    for (auto _ : state) {
        memcpy(dst.data(), src.data(), kBytes);
        benchmark::DoNotOptimize(dst.data());
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * kBytes);
}

// In place, as the extractor does; the data in the buffer after the first
// pass does not change the work done.
void BM_PackInt(benchmark::State& state) {
    std::vector<uint32_t> words = randomWords();
    for (auto _ : state) {
        QNMediaEditorUtils::ConvertXto24packed(reinterpret_cast<unsigned int*>(words.data()),
                                               reinterpret_cast<uint8_t*>(words.data()), kSamples, false);
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * kBytes);
}

void BM_PackFloat(benchmark::State& state) {
    std::vector<float> floats = randomFloats();
    const std::vector<float> original = floats;
    for (auto _ : state) {
        state.PauseTiming();
        memcpy(floats.data(), original.data(), kBytes);  // keep realistic samples
        state.ResumeTiming();
        QNMediaEditorUtils::ConvertXto24packed(floats.data(), reinterpret_cast<uint8_t*>(floats.data()), kSamples,
                                               false);
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * kBytes);
}

}  // namespace

BENCHMARK(BM_Memcpy)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_PackInt)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_PackFloat)->Unit(benchmark::kMicrosecond);

int main(int argc, char** argv) {
    return runWithRatios(argc, argv,
                         {{"BM_PackInt", "BM_Memcpy", "32-bit integer packing vs memcpy"},
                          {"BM_PackFloat", "BM_Memcpy", "float packing vs memcpy"}});
}
