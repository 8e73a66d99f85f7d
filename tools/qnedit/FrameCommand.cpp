#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

#include <kvucmm/FrameConverter.h>
#include <media/stagefright/foundation/AMessage.h>
#include <media/stagefright/foundation/ColorUtils.h>

#include "Cli.h"
#include "Commands.h"
#include "FramePicture.h"
#include "FrameVideo.h"
#include "Input.h"
#include "Interrupt.h"
#include "OutputFile.h"
#include "Png.h"

using namespace android;

namespace qnedit {

const char* const kFrameHelp =
    "usage: qnedit frame IN.mp4 --at SEC [--track N] -o OUT.png\n"
    "       qnedit frame IN.mp4 --count N [--track N] -o DIR/\n"
    "       qnedit frame IN.yuv --size WxH --format nv12|nv21|i420|yv12 [--stride N]\n"
    "                   [--slice-height N] [--crop L,T,R,B] [--range limited|full]\n"
    "                   [--standard bt601|bt709|bt2020] -o OUT.png\n"
    "\n"
    "A video's picture at a time (H.264 or HEVC), cropped and turned as a player\n"
    "shows it, or one decoded 4:2:0 frame from a raw file, made an RGB 5:6:5\n"
    "picture by the colour converter and saved as PNG.\n"
    "  --at SEC            the first picture shown at or after SEC\n"
    "  --count N           N pictures spread evenly over the video, saved as\n"
    "                      DIR/frame-001.png ... (the strip under a timeline)\n"
    "  --track N           the video track (default: the first)\n"
    "Raw frames:\n"
    "  --size WxH          the picture size\n"
    "  --format F          the frame's layout\n"
    "  --stride N          bytes from one luma row to the next (default: width)\n"
    "  --slice-height N    luma rows before the chroma plane (default: height)\n"
    "  --crop L,T,R,B      the visible rectangle, inclusive (default: the whole picture)\n"
    "  --range R           limited (default) or full\n"
    "  --standard S        colour matrix: bt601 (default), bt709 or bt2020\n";

namespace {

int32_t colorFormatOf(const std::string& name) {
    if (name == "nv12") return KVUCMM::kColorFormatYUV420SemiPlanar;
    if (name == "nv21") return KVUCMM::kColorFormatNV21;
    if (name == "i420") return KVUCMM::kColorFormatYUV420Planar;
    if (name == "yv12") return KVUCMM::kColorFormatYV12;
    usageError("--format takes nv12, nv21, i420 or yv12");
}

void parseSize(const std::string& text, int* w, int* h) {
    const size_t x = text.find('x');
    if (x == std::string::npos) usageError("--size takes WxH, e.g. 1280x720");
    *w = static_cast<int>(parseIntIn(text.substr(0, x), "--size", 1, 16384));
    *h = static_cast<int>(parseIntIn(text.substr(x + 1), "--size", 1, 16384));
}

std::vector<uint8_t> readWhole(const std::string& path) {
    const int fd = openRegularFile(path);
    struct stat st;
    if (fstat(fd, &st) != 0 || st.st_size > (int64_t(1) << 30)) {
        close(fd);
        inputError(path + ": not a frame file");
    }
    std::vector<uint8_t> bytes(static_cast<size_t>(st.st_size));
    size_t done = 0;
    while (done < bytes.size()) {
        const ssize_t n = read(fd, bytes.data() + done, bytes.size() - done);
        if (n <= 0) break;
        done += static_cast<size_t>(n);
    }
    close(fd);
    if (done != bytes.size()) inputError(path + ": read error");
    return bytes;
}

const std::vector<std::string> kRawOptions = {"--size", "--format", "--stride", "--slice-height", "--crop",
                                              "--range", "--standard"};
constexpr long kMaxCount = 1000;

void writePicture(const RgbImage& image, const std::string& path, const std::string& inPath) {
    OutputFile out(path, {inPath});
    std::string error;
    if (!writePng(out.fd(), image, &error)) inputError(path + ": " + error);
    out.commit();
}

// DIR/frame-001.png ..., numbered as wide as the count needs.
std::string stripName(const std::string& dir, long index, long count) {
    const int digits = std::max<int>(3, int(std::to_string(count).size()));
    char name[32];
    snprintf(name, sizeof(name), "frame-%0*ld.png", digits, index + 1);
    return dir + (dir.empty() || dir.back() == '/' ? "" : "/") + name;
}

int runVideoFrame(const Args& args, const std::string& inPath, const std::string& outPath) {
    for (const std::string& option : kRawOptions) {
        if (args.has(option)) usageError(option + " is for raw frames; a video file says its own layout");
    }
    if (args.has("--at") == args.has("--count")) usageError("give --at SEC or --count N");
    const long track = args.getIntIn("--track", -1, 0, 1 << 20);
    if (args.has("--at")) {
        const int64_t atUs = parseSeconds(args.get("--at"), "--at");
        checkOutputPath(outPath, {inPath});
        VideoPictures video(inPath, track);
        int64_t shownUs = 0;
        const RgbImage image = video.at(atUs, &shownUs);
        writePicture(image, outPath, inPath);
        fprintf(stderr, "%dx%d picture at %s -> %s\n", image.width, image.height, formatSeconds(shownUs).c_str(),
                outPath.c_str());
        return kExitOk;
    }
    const long count = args.getIntIn("--count", 1, 1, kMaxCount);
    struct stat st;
    const bool exists = stat(outPath.c_str(), &st) == 0;
    if (exists && !S_ISDIR(st.st_mode)) usageError("with --count, -o names a directory");
    VideoPictures video(inPath, track);
    if (!exists && mkdir(outPath.c_str(), 0777) != 0) {
        inputError(outPath + ": cannot make the directory (" + systemCause(errno) + ")");
    }
    catchInterrupts();
    for (long i = 0; i < count; ++i) {
        checkInterrupted();
        // Each picture starts its share of the video.
        int64_t shownUs = 0;
        const RgbImage image = video.at(video.durationUs() * i / count, &shownUs);
        const std::string path = stripName(outPath, i, count);
        writePicture(image, path, inPath);
        if (!gCommon.quiet) fprintf(stderr, "%s -> %s\n", formatSeconds(shownUs).c_str(), path.c_str());
    }
    fprintf(stderr, "%ld pictures -> %s\n", count, outPath.c_str());
    return kExitOk;
}

int runRawFrame(const Args& args, const std::string& inPath, const std::string& outPath) {
    if (args.has("--at") || args.has("--count") || args.has("--track")) {
        usageError("--at, --count and --track are for video files; a raw frame is one picture");
    }
    if (!args.has("--size") || !args.has("--format")) usageError("--size and --format are required");
    int width, height;
    parseSize(args.get("--size"), &width, &height);
    const int32_t colorFormat = colorFormatOf(args.get("--format"));
    // Bounded so that every plane size below fits comfortably in 64 bits and the
    // converter's int arithmetic.
    const int stride = static_cast<int>(args.getIntIn("--stride", width, width, 4 * 16384));
    const int sliceHeight = static_cast<int>(args.getIntIn("--slice-height", height, height, 4 * 16384));
    int left = 0, top = 0, right = width - 1, bottom = height - 1;
    if (args.has("--crop")) {
        const std::vector<std::string> parts = splitList(args.get("--crop"));
        if (parts.size() != 4) usageError("--crop takes L,T,R,B");
        left = static_cast<int>(parseIntIn(parts[0], "--crop", 0, width - 1));
        top = static_cast<int>(parseIntIn(parts[1], "--crop", 0, height - 1));
        right = static_cast<int>(parseIntIn(parts[2], "--crop", 0, width - 1));
        bottom = static_cast<int>(parseIntIn(parts[3], "--crop", 0, height - 1));
        if (left < 0 || top < 0 || right < left || bottom < top || right >= width || bottom >= height) {
            usageError("--crop must lie inside the picture");
        }
    }
    const std::string range = args.get("--range", "limited");
    if (range != "limited" && range != "full") usageError("--range takes limited or full");
    const std::string standard = args.get("--standard", "bt601");
    int32_t standardCode;
    if (standard == "bt601") standardCode = ColorUtils::kColorStandardBT601_625;
    else if (standard == "bt709") standardCode = ColorUtils::kColorStandardBT709;
    else if (standard == "bt2020") standardCode = ColorUtils::kColorStandardBT2020;
    else usageError("--standard takes bt601, bt709 or bt2020");

    const std::vector<uint8_t> frame = readWhole(inPath);
    // A 4:2:0 frame: the luma plane and two quarter-size chroma planes.
    const uint64_t need = uint64_t(stride) * uint64_t(sliceHeight) +
                          2 * ((uint64_t(stride) + 1) / 2) * ((uint64_t(sliceHeight) + 1) / 2);
    if (frame.size() < need) {
        inputError(inPath + ": " + std::to_string(frame.size()) + " bytes, a " + std::to_string(stride) + "x" +
                   std::to_string(sliceHeight) + " 4:2:0 frame needs " + std::to_string(need));
    }

    sp<AMessage> format = new AMessage;
    format->setInt32("width", width);
    format->setInt32("height", height);
    format->setInt32("stride", stride);
    format->setInt32("slice-height", sliceHeight);
    format->setRect("crop", left, top, right, bottom);
    format->setInt32("color-format", colorFormat);
    format->setInt32("color-range", range == "full" ? ColorUtils::kColorRangeFull : ColorUtils::kColorRangeLimited);
    format->setInt32("color-standard", standardCode);
    format->setInt32("color-transfer", ColorUtils::kColorTransferSMPTE_170M);

    const RgbImage image = framePicture(format, frame.data(), 0, inPath);
    writePicture(image, outPath, inPath);
    fprintf(stderr, "%dx%d RGB 5:6:5 -> %s\n", image.width, image.height, outPath.c_str());
    return kExitOk;
}

}  // namespace

int runFrame(const std::vector<std::string>& words) {
    std::vector<std::string> valued = kRawOptions;
    valued.insert(valued.end(), {"--at", "--count", "--track", "-o", "--output"});
    Args args(words, valued, {});
    args.expectPositional(1, "qnedit frame IN.mp4 --at SEC -o OUT.png (or IN.yuv --size WxH --format F -o OUT.png)");
    const std::string outPath = args.get("-o", args.get("--output"));
    if (outPath.empty()) usageError("-o is required");
    const std::string inPath = args.positional()[0];
    const bool raw = args.has("--size") || args.has("--format");
    return raw ? runRawFrame(args, inPath, outPath) : runVideoFrame(args, inPath, outPath);
}

}  // namespace qnedit
