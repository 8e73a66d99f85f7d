#ifndef PLATFORM_CODEC_LIBAV_LOG_H_
#define PLATFORM_CODEC_LIBAV_LOG_H_

namespace android {

// Sends the codec library's errors to our log instead of stderr; its
// warnings (about features it lacks) are dropped. Safe to call often.
void RouteLibavLog();

}  // namespace android

#endif
