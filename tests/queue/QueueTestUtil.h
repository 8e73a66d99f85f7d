#ifndef TESTS_QUEUE_TEST_UTIL_H
#define TESTS_QUEUE_TEST_UTIL_H

#include <cstring>

#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>

// An access unit of `size` bytes valued first, first+1, ... with its time.
inline android::sp<android::ABuffer> makeUnit(size_t size, int64_t timeUs, uint8_t first = 0) {
    android::sp<android::ABuffer> unit = new android::ABuffer(size);
    for (size_t i = 0; i < size; ++i) unit->data()[i] = static_cast<uint8_t>(first + i);
    unit->meta()->setInt64("timeUs", timeUs);
    return unit;
}

#endif
