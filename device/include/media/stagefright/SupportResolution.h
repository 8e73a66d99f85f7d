#ifndef SUPPORT_RESOLUTION_H_
#define SUPPORT_RESOLUTION_H_

namespace android {

// Whether the device can handle a video of this size. The meaning of the
// arguments and the rule table are documented in SupportResolution.cpp.
bool isSupportResolution(const char* mime, const char* component, int width, int height, bool encoder);

}  // namespace android

#endif
