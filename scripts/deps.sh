#!/usr/bin/env bash
# Installs the Debian packages the build, the tests and the demo need, when missing.
#   --fuzz  also the clang toolchain and sanitizer runtimes that scripts/fuzz.sh needs
#   --gen   also the producers the media generators in tests/media/gen/ run
set -euo pipefail
packages=(cmake g++ make pkg-config git libgtest-dev libgmock-dev libbenchmark-dev
          libflac-dev libogg-dev libvorbis-dev libsoxr-dev libyuv-dev libpng-dev
          libavcodec-dev libavutil-dev  # platform/codec: the codecs only
          ffmpeg flac sox libsox-fmt-all python3)
fuzz_packages=(clang libclang-rt-dev)
# Only the generators under tests/media/gen/ use these; the tests read the
# media they made, which is committed.
gen_packages=(vorbis-tools id3v2 sound-theme-freedesktop atomicparsley jq nodejs
              gstreamer1.0-tools gstreamer1.0-plugins-good gstreamer1.0-plugins-bad
              gstreamer1.0-plugins-ugly gstreamer1.0-libav)
for option in "$@"; do
  case $option in
    --fuzz) packages+=("${fuzz_packages[@]}") ;;
    --gen) packages+=("${gen_packages[@]}") ;;
    *) echo "usage: deps.sh [--fuzz] [--gen]" >&2; exit 2 ;;
  esac
done
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
