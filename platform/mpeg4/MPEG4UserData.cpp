#define LOG_TAG "MPEG4UserData"
#include "mpeg4/MPEG4UserData.h"

#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include <log/log.h>

#include "mpeg4/MPEG4Box.h"
#include "extractor/DeviceKeys.h"

namespace android {
namespace mpeg4 {

namespace {

constexpr uint8_t kSphereViewUuid[16] = {'Q', 'N', 'E', 'D', '-', 'S', 'P', 'H',
                                         'E', 'R', 'E', 'V', 'I', 'E', 'W', '1'};

std::string TextOf(const ByteReader& r) {
    return std::string(reinterpret_cast<const char*>(r.current()), r.remaining());
}

// QuickTime user-data text: 16-bit length, 16-bit language, text. Some
// writers store the ISO 6709 text bare.
bool ReadXyz(ByteReader r, std::string* location) {
    if (r.remaining() > 0 && (r.current()[0] == '+' || r.current()[0] == '-')) {
        *location = TextOf(r);
        return true;
    }
    uint16_t length, language;
    ByteReader text(nullptr, 0);
    if (!r.be16(&length) || !r.be16(&language) || !r.sub(length, &text)) return false;
    *location = TextOf(text);
    return true;
}

bool SkipTerminatedString(ByteReader* r) {
    const bool utf16 = r->remaining() >= 2 && r->current()[0] == 0xFE && r->current()[1] == 0xFF;
    while (true) {
        uint16_t unit;
        uint8_t byte;
        if (utf16 ? !r->be16(&unit) : !r->u8(&byte)) return false;
        if ((utf16 ? unit : byte) == 0) return true;
    }
}

// 3GPP location information (3GPP TS 26.244, 8.10): coordinates in signed
// 16.16 degrees after the place name and its role.
bool ReadLoci(ByteReader r, std::string* location) {
    uint8_t version, role;
    uint32_t flags, longitude, latitude;
    uint16_t language;
    if (!ReadFullBoxHeader(&r, &version, &flags) || !r.be16(&language) || !SkipTerminatedString(&r) ||
        !r.u8(&role) || !r.be32(&longitude) || !r.be32(&latitude)) {
        return false;
    }
    char text[32];
    snprintf(text, sizeof(text), "%+08.4f%+09.4f/", int32_t(latitude) / 65536.0, int32_t(longitude) / 65536.0);
    *location = text;
    return true;
}

}  // namespace

void ParseUserData(const ByteReader& udta, MetaData* meta, DeviceItems* items) {
    std::string xyz, loci;
    BoxIterator it(udta);
    while (it.next()) {
        const uint32_t type = it.header().type;
        const ByteReader& payload = it.payload();
        if (DeviceItems::IsItem(type)) {
            items->take(type, payload.current(), payload.remaining(), true);
            continue;
        }
        switch (type) {
            case FourCC('\xA9', 'x', 'y', 'z'):
                if (!ReadXyz(payload, &xyz)) ALOGW("unreadable location");
                break;
            case FourCC('l', 'o', 'c', 'i'):
                if (!ReadLoci(payload, &loci)) ALOGW("unreadable 3GPP location");
                break;
            case FourCC('q', 'n', 'r', 't'):
                meta->setCString(kKeyDeviceVideoRecordType, TextOf(payload).c_str());
                break;
            case FourCC('w', 'a', 'f', '2'):
                meta->setData(kKeyDeviceWaveForm2, 0, payload.current(), payload.remaining());
                break;
            default:
                break;
        }
    }
    items->publishFileItems(meta);
    if (!xyz.empty()) {
        meta->setCString(kKeyLocation, xyz.c_str());
    } else if (!loci.empty()) {
        meta->setCString(kKeyLocation, loci.c_str());
    }
}

bool IsSphereViewUuid(const uint8_t userType[16]) {
    return memcmp(userType, kSphereViewUuid, sizeof(kSphereViewUuid)) == 0;
}

void SetSphereView(MetaData* meta, const uint8_t* data, size_t size) {
    std::vector<uint8_t> item(data, data + size);
    item.push_back(0);
    meta->setData(kKeyDeviceSphereView, 0, item.data(), item.size());
}

}  // namespace mpeg4
}  // namespace android
