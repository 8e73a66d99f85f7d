// Placeholder until the rule table lands.
#include <media/stagefright/SupportResolution.h>

namespace android {
bool isSupportResolution(const char*, const char*, int, int, bool) { return true; }
}  // namespace android
