#ifndef META_DATA_BASE_H_
#define META_DATA_BASE_H_

#include <cstddef>
#include <cstdint>
#include <map>
#include <vector>

#include <utils/String8.h>

namespace android {

// Four-character keys, first character in the top byte.
enum {
    kKeyMIMEType = 'mime',            // cstring
    kKeyWidth = 'widt',               // int32
    kKeyHeight = 'heig',              // int32
    kKeyDisplayWidth = 'dWid',        // int32
    kKeyDisplayHeight = 'dHgt',       // int32
    kKeySARWidth = 'sarW',            // int32
    kKeySARHeight = 'sarH',           // int32
    kKeyStride = 'strd',              // int32
    kKeySliceHeight = 'slht',         // int32
    kKeyCropRect = 'crop',            // rect
    kKeyRotation = 'rotA',            // int32, degrees
    kKeyIFramesInterval = 'ifiv',     // int32
    kKeyStride2 = 'str2',
    kKeyChannelCount = '#chn',        // int32
    kKeyChannelMask = 'chnm',         // int32
    kKeySampleRate = 'srte',          // int32
    kKeyPcmEncoding = 'PCMe',         // int32
    kKeyBitsPerSample = 'sbit',       // int32
    kKeyFrameRate = 'frmR',           // int32
    kKeyBitRate = 'brte',             // int32, bit/s
    kKeyMaxBitRate = 'mxBr',          // int32
    kKeyStreamHeader = 'stHd',        // raw data
    kKeyESDS = 'esds',                // raw data
    kKeyAACProfile = 'aacp',          // int32
    kKeyAACAOT = 'aaot',              // int32
    kKeyIsADTS = 'adts',              // int32
    kKeyAVCC = 'avcc',                // raw data
    kKeyHVCC = 'hvcc',                // raw data
    kKeyVorbisInfo = 'vinf',          // raw data: identification header packet
    kKeyVorbisBooks = 'vboo',         // raw data: setup header packet
    kKeyFlacMetadata = 'flMd',        // raw data: "fLaC" and the metadata blocks
    kKeyIsSyncFrame = 'sync',         // int32
    kKeyIsCodecConfig = 'conf',       // int32
    kKeyTime = 'time',                // int64, us
    kKeyDecodingTime = 'decT',        // int64, us
    kKeyNTPTime = 'ntpT',             // uint64
    kKeyTargetTime = 'tarT',          // int64, us
    kKeyDuration = 'dura',            // int64, us
    kKeyColorFormat = 'colf',         // int32
    kKeyMaxInputSize = 'inpS',        // int32
    kKeyThumbnailTime = 'thbT',       // int64, us
    kKeyTrackID = 'trID',             // int32
    kKeyEncoderDelay = 'encd',        // int32, frames
    kKeyEncoderPadding = 'encp',      // int32, frames
    kKeyMediaLanguage = 'lang',       // cstring
    kKeyTitle = 'titl',               // cstring
    kKeyLocation = 'loc ',            // cstring, ISO 6709
    kKeyTimeScale = 'tmsl',           // int32
    kKeyFileType = 'ftyp',            // int32
    kKeyRealTimeRecording = 'rtrc',   // int32
    kKeyValidSamples = 'valD',        // int32
    kKeySEI = 'sei ',                 // raw data
    kKeyMpegUserData = 'mpud',        // raw data
    kKeyPssh = 'pssh',                // raw data
    kKeyColorRange = 'cRng',          // int32
    kKeyColorPrimaries = 'cPrm',      // int32
    kKeyTransferFunction = 'tFun',    // int32
    kKeyColorMatrix = 'cMtx',         // int32
    kKeyHdrStaticInfo = 'hdrS',       // raw data
    kKey64BitFileOffset = 'fobt',     // int32
    kKey2ByteNalLength = '2NAL',      // int32
    kKeyIsUnreadable = 'unre',        // int32
    // Facts a track's index gives without reading its samples.
    kKeySampleCount = 'nSmp',         // int64: samples (buffers) the track's source hands out
    kKeySyncSampleCount = 'nSyn',     // int64: the sync samples among them
    kKeyTruncatedAtUs = 'trnT',       // int64, us: where the track's data runs past the end of the file
};

enum {
    kTypeESDS = 'esds',
    kTypeAVCC = 'avcc',
    kTypeHVCC = 'hvcc',
    kTypeD263 = 'd263',
};

// Typed values under four-character keys: C strings, int32, int64, float,
// pointers, rectangles and raw blobs tagged with a type.
class MetaDataBase {
public:
    MetaDataBase();
    MetaDataBase(const MetaDataBase& from);
    MetaDataBase& operator=(const MetaDataBase& rhs);
    virtual ~MetaDataBase();

    enum Type {
        TYPE_NONE = 'none',
        TYPE_C_STRING = 'cstr',
        TYPE_INT32 = 'in32',
        TYPE_INT64 = 'in64',
        TYPE_FLOAT = 'floa',
        TYPE_POINTER = 'ptr ',
        TYPE_RECT = 'rect',
    };

    void clear();
    bool remove(uint32_t key);

    bool setCString(uint32_t key, const char* value);
    bool setInt32(uint32_t key, int32_t value);
    bool setInt64(uint32_t key, int64_t value);
    bool setFloat(uint32_t key, float value);
    bool setPointer(uint32_t key, void* value);
    bool setRect(uint32_t key, int32_t left, int32_t top, int32_t right, int32_t bottom);

    bool findCString(uint32_t key, const char** value) const;
    bool findInt32(uint32_t key, int32_t* value) const;
    bool findInt64(uint32_t key, int64_t* value) const;
    bool findFloat(uint32_t key, float* value) const;
    bool findPointer(uint32_t key, void** value) const;
    bool findRect(uint32_t key, int32_t* left, int32_t* top, int32_t* right, int32_t* bottom) const;

    // Copies the bytes; answers true when the key replaced an earlier value.
    bool setData(uint32_t key, uint32_t type, const void* data, size_t size);
    // The pointer stays valid until the key is set again or removed.
    bool findData(uint32_t key, uint32_t* type, const void** data, size_t* size) const;
    bool hasData(uint32_t key) const;

    size_t countEntries() const { return mItems.size(); }
    // Keys in ascending order, for conversion and dumps.
    std::vector<uint32_t> keys() const;

    String8 toString() const;
    void dumpToLog() const;

private:
    struct typed_data {
        uint32_t mType = TYPE_NONE;
        std::vector<uint8_t> mData;
    };
    std::map<uint32_t, typed_data> mItems;
};

}  // namespace android

#endif
