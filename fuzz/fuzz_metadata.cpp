#include "MetadataTarget.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    quietLogs();
    fuzztargets::fuzzMetadata(data, size);
    return 0;
}
