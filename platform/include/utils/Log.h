#ifndef ANDROID_UTILS_LOG_H
#define ANDROID_UTILS_LOG_H
#include <log/log.h>
#endif
