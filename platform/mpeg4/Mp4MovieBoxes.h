#ifndef MP4_MOVIE_BOXES_H_
#define MP4_MOVIE_BOXES_H_

#include <cstdint>
#include <vector>

#include "writer/WriterDeviceItems.h"

namespace android {

class Mp4BoxWriter;
class Mp4TrackWriter;
struct Mp4DeviceItems;

// 'ftyp': "mp42" (compatible isom, mp42), or "M4A " for audio files.
void Mp4WriteFileType(Mp4BoxWriter& w, bool m4a);

// 'moov' for finished tracks (track IDs 1, 2, ... in order), with the
// device's user data.
void Mp4WriteMovie(Mp4BoxWriter& w, const std::vector<const Mp4TrackWriter*>& tracks, const Mp4DeviceItems& items,
                   const WriterDeviceItems::Snapshot& shared, int32_t rotation);

// The movie time scale: the coarsest of 1000, 90000 and 1000000 in which
// every track's presentation start is exact.
uint32_t Mp4ChooseMovieTimescale(const std::vector<const Mp4TrackWriter*>& tracks);

}  // namespace android

#endif
