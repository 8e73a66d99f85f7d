#include "FlacConverterTarget.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    quietLogs();
    fuzztargets::fuzzFlacConverter(data, size);
    return 0;
}
