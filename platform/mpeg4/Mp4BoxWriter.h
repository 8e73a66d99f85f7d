#ifndef MP4_BOX_WRITER_H_
#define MP4_BOX_WRITER_H_

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include <media/stagefright/ByteSink.h>

namespace android {

// Builds nested ISO boxes in memory. A box's size is patched when it is
// closed, so callers never compute sizes by hand.
class Mp4BoxWriter {
public:
    Mp4BoxWriter();

    void beginBox(const char type[4]);
    void beginFullBox(const char type[4], uint8_t version, uint32_t flags);
    void endBox();

    void u8(uint8_t v) { mSink->writeU8(v); }
    void be16(uint16_t v) { mSink->writeBE16(v); }
    void be24(uint32_t v);
    void be32(uint32_t v) { mSink->writeBE32(v); }
    void be64(uint64_t v) { mSink->writeBE64(v); }
    void fourcc(const char type[4]) { mSink->write(type, 4); }
    void bytes(const void* data, size_t size) { if (size > 0) mSink->write(data, size); }
    void bytes(const std::vector<uint8_t>& data) { bytes(data.data(), data.size()); }
    void zeros(size_t count);
    // A whole box holding only `payload`.
    void leafBox(const char type[4], const void* payload, size_t size);

    size_t size() const { return mSink->bytes().size(); }
    const std::string& data() const { return mSink->bytes(); }
    // Writes what was built to `out` (all boxes must be closed).
    status_t writeTo(ByteSink* out) const;

private:
    sp<MemorySink> mSink;
    std::vector<size_t> mOpen;  // start offsets of the boxes not yet closed
};

// The bytes that open the media data: an 8-byte 'free' box followed by the
// 8-byte 'mdat' header. When the data outgrows 32-bit sizes, the 16 bytes
// become one 'mdat' header with a 64-bit size (ISO/IEC 14496-12 4.2), so no
// data has to move.
constexpr size_t kMdatReserve = 16;
std::string Mp4MdatPlaceholder();
// The 16 bytes that replace the placeholder once `payloadBytes` are known.
std::string Mp4MdatHeader(uint64_t payloadBytes);

}  // namespace android

#endif
