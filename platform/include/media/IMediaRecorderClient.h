#ifndef ANDROID_IMEDIARECORDERCLIENT_H
#define ANDROID_IMEDIARECORDERCLIENT_H

#include <utils/RefBase.h>

namespace android {

// Receives a writer's events (info and error codes, as the recorder's).
class IMediaRecorderClient : public virtual RefBase {
public:
    virtual void notify(int msg, int ext1, int ext2) = 0;

protected:
    ~IMediaRecorderClient() override = default;
};

}  // namespace android

#endif
