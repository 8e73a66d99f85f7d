#ifndef UTILS_H_
#define UTILS_H_

#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/AMessage.h>
#include <utils/Errors.h>

namespace android {

// Conversion between track metadata and track format messages. The key
// table (metadata key <-> message key) is documented in the source.
status_t convertMetaDataToMessage(const MetaDataBase* meta, sp<AMessage>* format);
status_t convertMetaDataToMessage(const sp<MetaData>& meta, sp<AMessage>* format);
void convertMessageToMetaData(const sp<AMessage>& format, sp<MetaData>& meta);

}  // namespace android

#endif
