#define LOG_TAG "MPEG4Writer"
#include "mpeg4/Mp4MovieBoxes.h"

#include <ctime>

#include "mpeg4/Mp4BoxWriter.h"
#include "mpeg4/Mp4DeviceItems.h"
#include "mpeg4/Mp4TrackWriter.h"

namespace android {

void Mp4WriteFileType(Mp4BoxWriter& w, bool m4a) {
    w.beginBox("ftyp");
    w.fourcc(m4a ? "M4A " : "mp42");
    w.be32(0);
    if (m4a) w.fourcc("M4A ");
    w.fourcc("mp42");
    w.fourcc("isom");
    w.endBox();
}

uint32_t Mp4ChooseMovieTimescale(const std::vector<const Mp4TrackWriter*>& tracks) {
    for (uint32_t ts : {1000u, 90000u, 1000000u}) {
        bool exact = true;
        for (const Mp4TrackWriter* t : tracks) {
            const int64_t start = t->timing().startUs;
            exact = exact && Mp4TicksToUs(Mp4UsToTicks(start, ts), ts) == start;
        }
        if (exact) return ts;
    }
    return 1000000;
}

void Mp4WriteMovie(Mp4BoxWriter& w, const std::vector<const Mp4TrackWriter*>& tracks, const Mp4DeviceItems& items,
                   const WriterDeviceItems::Snapshot& shared, int32_t rotation) {
    // Seconds since 1904-01-01, as the movie header counts them.
    const uint64_t now = static_cast<uint64_t>(time(nullptr)) + 2082844800ULL;
    const uint32_t created = now > UINT32_MAX ? 0 : static_cast<uint32_t>(now);
    const uint32_t timescale = Mp4ChooseMovieTimescale(tracks);
    uint64_t duration = 0;
    for (const Mp4TrackWriter* t : tracks) {
        const uint64_t d = t->timing().presentedDuration(timescale);
        if (d > duration) duration = d;
    }

    w.beginBox("moov");
    const bool wide = duration > UINT32_MAX;
    w.beginFullBox("mvhd", wide ? 1 : 0, 0);
    if (wide) {
        w.be64(created);
        w.be64(created);
        w.be32(timescale);
        w.be64(duration);
    } else {
        w.be32(created);
        w.be32(created);
        w.be32(timescale);
        w.be32(static_cast<uint32_t>(duration));
    }
    w.be32(0x00010000);  // rate 1.0
    w.be16(0x0100);      // volume 1.0
    w.zeros(10);
    const uint32_t identity[9] = {0x10000, 0, 0, 0, 0x10000, 0, 0, 0, 0x40000000};
    for (uint32_t v : identity) w.be32(v);
    w.zeros(24);
    w.be32(static_cast<uint32_t>(tracks.size() + 1));  // next_track_ID
    w.endBox();

    for (size_t i = 0; i < tracks.size(); ++i) {
        tracks[i]->writeTrak(w, static_cast<uint32_t>(i + 1), timescale, rotation, created);
    }
    items.writeUserData(w, shared);
    w.endBox();
}

}  // namespace android
