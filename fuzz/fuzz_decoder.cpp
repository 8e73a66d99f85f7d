#include "DecoderTarget.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    quietLogs();
    fuzztargets::fuzzDecoder(data, size);
    return 0;
}
