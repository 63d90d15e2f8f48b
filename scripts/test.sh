#!/usr/bin/env bash
# Builds LUD Mox and runs every test with CTest.
set -euo pipefail
cd "$(dirname "$0")/.."

bash scripts/setup-debian.sh
bash scripts/start-services.sh

build_dir=${LUDMOX_BUILD_DIR:-build}
# The sanitizer build only runs the tests: it is built unoptimised, which compiles fastest.
build_type=Release
[ "${LUDMOX_SANITIZE:-OFF}" = ON ] && build_type=Debug
cmake -S . -B "$build_dir" -G Ninja -DCMAKE_BUILD_TYPE=$build_type \
    -DLUDMOX_WERROR="${LUDMOX_WERROR:-OFF}" -DLUDMOX_SANITIZE="${LUDMOX_SANITIZE:-OFF}"
cmake --build "$build_dir"
export ASAN_OPTIONS=${ASAN_OPTIONS:-detect_leaks=1:abort_on_error=1}
export UBSAN_OPTIONS=${UBSAN_OPTIONS:-print_stacktrace=1:halt_on_error=1}
ctest --test-dir "$build_dir" --output-on-failure -j2
