#ifndef MEDIA_TRACK_H_
#define MEDIA_TRACK_H_

#include <cstdint>

namespace android {

struct MediaTrack {
    // Options for read(): a seek, and how the target is met.
    class ReadOptions {
    public:
        enum SeekMode : int32_t {
            SEEK_PREVIOUS_SYNC = 0,  // the sync sample at or before the time
            SEEK_NEXT_SYNC = 1,      // the sync sample at or after the time
            SEEK_CLOSEST_SYNC = 2,   // the sync sample nearest the time
            SEEK_CLOSEST = 3,        // the sample nearest the time
            SEEK_FRAME_INDEX = 4,
        };

        ReadOptions() { reset(); }
        void reset() {
            mOptions = 0;
            mSeekTimeUs = 0;
            mSeekMode = SEEK_CLOSEST_SYNC;
            mNonBlocking = false;
        }
        void setSeekTo(int64_t time_us, SeekMode mode = SEEK_CLOSEST_SYNC) {
            mOptions |= kSeekTo_Option;
            mSeekTimeUs = time_us;
            mSeekMode = mode;
        }
        void clearSeekTo() {
            mOptions &= ~kSeekTo_Option;
            mSeekTimeUs = 0;
            mSeekMode = SEEK_CLOSEST_SYNC;
        }
        bool getSeekTo(int64_t* time_us, SeekMode* mode) const {
            *time_us = mSeekTimeUs;
            *mode = mSeekMode;
            return (mOptions & kSeekTo_Option) != 0;
        }
        void setNonBlocking() { mNonBlocking = true; }
        void clearNonBlocking() { mNonBlocking = false; }
        bool getNonBlocking() const { return mNonBlocking; }

    private:
        enum Options { kSeekTo_Option = 1 };
        uint32_t mOptions;
        int64_t mSeekTimeUs;
        SeekMode mSeekMode;
        bool mNonBlocking;
    };
};

}  // namespace android

#endif
