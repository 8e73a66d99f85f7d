#!/usr/bin/env bash
# Builds and runs the consumer program against the library.
#   check_consumer.sh install BUILD_DIR WORK_DIR [SANITIZE]
#     installs BUILD_DIR into WORK_DIR/prefix and uses find_package;
#   check_consumer.sh subdirectory SOURCE_DIR WORK_DIR [SANITIZE]
#     builds the whole project again through add_subdirectory (slow).
set -euo pipefail
mode=$1 tree=$2 work=$3 sanitize=${4:-}
here=$(cd "$(dirname "$0")" && pwd)
rm -rf "$work"
mkdir -p "$work"
args=(-S "$here" -B "$work/build" -DCMAKE_BUILD_TYPE=RelWithDebInfo)
if [ -n "$sanitize" ]; then
  args+=("-DCMAKE_CXX_FLAGS=-fsanitize=$sanitize" "-DCMAKE_EXE_LINKER_FLAGS=-fsanitize=$sanitize")
fi
case "$mode" in
  install)
    cmake --install "$tree" --prefix "$work/prefix" >/dev/null
    args+=("-DCMAKE_PREFIX_PATH=$work/prefix")
    ;;
  subdirectory)
    args+=("-DMEDIAEDITOR_SOURCE_DIR=$tree" "-DMEDIAEDITOR_SANITIZE=$sanitize")
    ;;
  *) echo "unknown mode $mode" >&2; exit 2 ;;
esac
cmake "${args[@]}" >/dev/null
# The public headers must compile cleanly in the consumer: any warning fails.
cmake --build "$work/build" -j"$(nproc)" 2>&1 | { ! grep -E "warning|error"; }
"$work/build/consumer"
