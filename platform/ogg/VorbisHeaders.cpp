#define LOG_TAG "OggExtractor"
#include "ogg/VorbisHeaders.h"

#include <algorithm>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

#include "ogg/OggPageReader.h"

namespace android {

namespace {
// Comment packets can carry pictures, but not more than this.
constexpr long kMaxHeaderBytes = 16 * 1024 * 1024;
}

VorbisHeaders::VorbisHeaders() : mCount(0), mSerial(0), mAudioStart(0) {
    vorbis_info_init(&mInfo);
    vorbis_comment_init(&mComment);
}

VorbisHeaders::~VorbisHeaders() {
    vorbis_comment_clear(&mComment);
    vorbis_info_clear(&mInfo);
}

long VorbisHeaders::blockSize(ogg_packet* packet) const {
    // libvorbis only reads the codec set-up here.
    return vorbis_packet_blocksize(const_cast<vorbis_info*>(&mInfo), packet);
}

status_t VorbisHeaders::add(ogg_packet* packet) {
    packet->b_o_s = mCount == 0;
    const int err = vorbis_synthesis_headerin(&mInfo, &mComment, packet);
    if (err != 0) {
        ALOGW("Vorbis header %d rejected (%d)", mCount, err);
        return ERROR_MALFORMED;
    }
    if (mCount == 0) mIdentification.assign(packet->packet, packet->packet + packet->bytes);
    if (mCount == 2) mSetup.assign(packet->packet, packet->packet + packet->bytes);
    ++mCount;
    return OK;
}

bool VorbisHeaders::decodesLike(const VorbisHeaders& other) const {
    // Identification header (Vorbis I, 4.2.2): the bitrate fields at 16..27
    // only describe the stream; rate, channels and block sizes matter.
    auto same = [&](size_t from, size_t to) {
        return mIdentification.size() >= to && other.mIdentification.size() >= to &&
               std::equal(mIdentification.begin() + from, mIdentification.begin() + to,
                          other.mIdentification.begin() + from);
    };
    return same(0, 16) && same(28, 30) && mSetup == other.mSetup;
}

status_t VorbisHeaders::read(const sp<DataSource>& source, off64_t start) {
    OggPageReader reader(source);
    reader.seek(start);
    ogg_stream_state stream;
    bool haveStream = false;
    status_t err = OK;
    while (mCount < 3 && err == OK) {
        ogg_page page;
        off64_t offset;
        err = reader.nextPage(&page, &offset);
        if (err != OK) break;
        if (!haveStream) {
            // The first page opens the stream whose headers come first.
            if (offset != start || !ogg_page_bos(&page)) {
                err = ERROR_MALFORMED;
                break;
            }
            mSerial = ogg_page_serialno(&page);
            ogg_stream_init(&stream, mSerial);
            haveStream = true;
        }
        if (ogg_page_serialno(&page) != mSerial) continue;
        if (ogg_stream_pagein(&stream, &page) != 0 || stream.body_fill > kMaxHeaderBytes) {
            err = ERROR_MALFORMED;
            break;
        }
        ogg_packet packet;
        int got;
        while (err == OK && mCount < 3 && (got = ogg_stream_packetout(&stream, &packet)) != 0) {
            err = got < 0 ? ERROR_MALFORMED : add(&packet);
        }
        mAudioStart = reader.position();
    }
    if (haveStream) ogg_stream_clear(&stream);
    if (err == OK && (mInfo.rate <= 0 || mInfo.channels <= 0)) err = ERROR_MALFORMED;
    if (err != OK) ALOGW("no usable Vorbis headers (%d)", err);
    return err == ERROR_END_OF_STREAM ? ERROR_MALFORMED : err;
}

}  // namespace android
