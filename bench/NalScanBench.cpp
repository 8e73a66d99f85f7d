// Walking a 16 MB Annex-B stream unit by unit against memchr over the same bytes.
#include <cstring>
#include <random>
#include <vector>

#include "BenchRatio.h"
#include "QNMediaEditorUtils.h"

using android::qnmediaeditor::QNMediaEditorUtils;

namespace {

constexpr size_t kBytes = 16 << 20;
// Entropy-coded payload never holds this value here, so one memchr for it
// reads every byte: the floor for any scan.
constexpr uint8_t kAbsent = 0xFF;

// Random payload with emulation prevention (ITU-T H.264 7.4.1), ending in a
// non-zero byte as an RBSP does.
void appendUnit(std::vector<uint8_t>* s, std::mt19937* rng, uint8_t header, size_t size, bool longStartCode) {
    if (longStartCode) s->push_back(0);
    s->insert(s->end(), {0, 0, 1, header});
    int zeros = 0;
    for (size_t i = 0; i < size; ++i) {
        uint8_t b = static_cast<uint8_t>((*rng)() % 255);
        if (i + 1 == size && b == 0) b = 0x80;
        if (zeros >= 2 && b <= 3) {
            s->push_back(3);
            zeros = 0;
        }
        s->push_back(b);
        zeros = b == 0 ? zeros + 1 : 0;
    }
}

// A 720p-like stream: an IDR picture of 40-120 KB every 30 pictures with
// its parameter sets, P pictures of 4-24 KB, each picture one slice.
std::vector<uint8_t> makeStream(size_t* units) {
    std::vector<uint8_t> s;
    s.reserve(kBytes + (256 << 10));
    std::mt19937 rng(3);
    *units = 0;
    for (int picture = 0; s.size() < kBytes; ++picture) {
        appendUnit(&s, &rng, 0x09, 1, true);  // access unit delimiter
        ++*units;
        if (picture % 30 == 0) {
            appendUnit(&s, &rng, 0x67, 12, true);
            appendUnit(&s, &rng, 0x68, 4, true);
            appendUnit(&s, &rng, 0x65, 40000 + rng() % 80000, false);
            *units += 3;
        } else {
            appendUnit(&s, &rng, 0x41, 4000 + rng() % 20000, false);
            ++*units;
        }
    }
    s.resize(kBytes);
    return s;
}

const std::vector<uint8_t>& stream(size_t* units = nullptr) {
    static size_t count = 0;
    static const std::vector<uint8_t> s = makeStream(&count);
    if (units != nullptr) *units = count;
    return s;
}

void BM_GetNextNALUnit(benchmark::State& state) {
    const std::vector<uint8_t>& s = stream();
    size_t found = 0;
    for (auto _ : state) {
        const uint8_t* data = s.data();
        size_t size = s.size();
        const uint8_t* unit;
        size_t unitSize;
        found = 0;
        while (size > 0 && QNMediaEditorUtils::getNextNALUnit(&data, &size, &unit, &unitSize, true) == 0) ++found;
        benchmark::DoNotOptimize(found);
    }
    state.counters["units"] = static_cast<double>(found);
    state.SetBytesProcessed(int64_t(state.iterations()) * kBytes);
}

void BM_Memchr(benchmark::State& state) {
    const std::vector<uint8_t>& s = stream();
    for (auto _ : state) benchmark::DoNotOptimize(memchr(s.data(), kAbsent, s.size()));
    state.SetBytesProcessed(int64_t(state.iterations()) * kBytes);
}

// memchr hopping from one 0x01 byte to the next, as a start-code search must.
void BM_MemchrEveryOne(benchmark::State& state) {
    const std::vector<uint8_t>& s = stream();
    for (auto _ : state) {
        size_t hits = 0;
        const uint8_t* p = s.data();
        const uint8_t* const end = p + s.size();
        while ((p = static_cast<const uint8_t*>(memchr(p, 0x01, end - p))) != nullptr) {
            ++hits;
            ++p;
        }
        benchmark::DoNotOptimize(hits);
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * kBytes);
}

}  // namespace

BENCHMARK(BM_Memchr)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_MemchrEveryOne)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_GetNextNALUnit)->Unit(benchmark::kMicrosecond);

int main(int argc, char** argv) {
    return runWithRatios(argc, argv,
                         {{"BM_GetNextNALUnit", "BM_Memchr", "NAL walk vs one memchr over all bytes"},
                          {"BM_GetNextNALUnit", "BM_MemchrEveryOne", "NAL walk vs memchr from each 0x01 to the next"}});
}
