#ifndef META_DATA_H_
#define META_DATA_H_

#include <media/stagefright/MetaDataBase.h>
#include <utils/RefBase.h>

namespace android {

class MetaData final : public MetaDataBase, public RefBase {
public:
    MetaData() = default;
    MetaData(const MetaData& from) : MetaDataBase(from), RefBase() {}
    explicit MetaData(const MetaDataBase& from) : MetaDataBase(from), RefBase() {}

protected:
    ~MetaData() override = default;
};

}  // namespace android

#endif
