#ifndef ANDROID_CUTILS_LOG_H
#define ANDROID_CUTILS_LOG_H
#include <log/log.h>
#endif
