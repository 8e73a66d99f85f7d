#ifndef MEDIA_EXTRACTOR_REFUSAL_H_
#define MEDIA_EXTRACTOR_REFUSAL_H_

#include <string>

namespace android {

// Why the last attempt on this thread to open a file was refused, in words a
// user can act on ("WAVE encoding 17 (IMA ADPCM) is not supported"). Statuses
// stay as they are; this only carries the cause to whoever asked, without
// parsing the log.
//
// The reason is thread-local. MediaExtractorFactory::Create clears it when it
// starts and again when it hands out an extractor, so after a null return the
// caller on the same thread may take it. Sniffers and extractors set it where
// they refuse something they recognised; a later reason replaces an earlier
// one. Empty when nobody said why.
void setRefusalReason(const char* fmt, ...) __attribute__((format(printf, 1, 2)));
// Answers the reason and clears it.
std::string takeRefusalReason();
// Answers the reason and keeps it.
const std::string& peekRefusalReason();
void clearRefusalReason();

}  // namespace android

#endif
