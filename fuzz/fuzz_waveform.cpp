#include "WaveformTarget.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    quietLogs();
    fuzztargets::fuzzWaveform(data, size);
    return 0;
}
