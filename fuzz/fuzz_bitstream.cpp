#include "BitstreamTarget.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    quietLogs();
    fuzztargets::fuzzBitstream(data, size);
    return 0;
}
