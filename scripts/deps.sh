#!/usr/bin/env bash
# Installs the Debian packages the build, the tests and the demo need, when missing.
#   --fuzz  also the clang toolchain and sanitizer runtimes that scripts/fuzz.sh needs
set -euo pipefail
packages=(cmake g++ make pkg-config git libgtest-dev libgmock-dev libbenchmark-dev
          libflac-dev libogg-dev libvorbis-dev libsoxr-dev libyuv-dev libpng-dev
          libavcodec-dev libavutil-dev  # platform/codec: the codecs only
          ffmpeg flac sox libsox-fmt-all python3
          vorbis-tools id3v2 sound-theme-freedesktop  # tests/media/gen/foreign_audio.sh
          atomicparsley  # tests/media/gen/mp4.sh
          jq nodejs gstreamer1.0-tools gstreamer1.0-plugins-good gstreamer1.0-plugins-bad
          gstreamer1.0-plugins-ugly gstreamer1.0-libav)  # tests/media/gen/mp4*.sh
fuzz_packages=(clang libclang-rt-dev)
[ "${1:-}" = "--fuzz" ] && packages+=("${fuzz_packages[@]}")
missing=()
for p in "${packages[@]}"; do
  dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q "install ok installed" || missing+=("$p")
done
if [ ${#missing[@]} -gt 0 ]; then
  echo "installing: ${missing[*]}"
  sudo_cmd=""
  [ "$(id -u)" -ne 0 ] && sudo_cmd="sudo"
  $sudo_cmd apt-get update -qq
  DEBIAN_FRONTEND=noninteractive $sudo_cmd apt-get install -y -qq "${missing[@]}"
fi
