#!/usr/bin/env bash
# Builds the libFuzzer targets with clang, ASan and UBSan (libraries instrumented too) in
# build-fuzz and runs each for a while, growing its committed corpus in tests/data/fuzz.
#
#   scripts/fuzz.sh [seconds per target, default 600] [target ...]
#
# Targets: document formula protocol selection (all by default). Two run at a time. New
# inputs are merged (-merge=1) into tests/data/fuzz/<target>, so only inputs that add
# coverage are kept; a failing input is left as build-fuzz/artifacts/<target>-crash-*.
# Not for CI: it takes as long as it is told to.
set -euo pipefail

root=$(cd "$(dirname "$0")/.." && pwd)
seconds=${1:-600}
shift || true
targets=("$@")
[[ ${#targets[@]} -gt 0 ]] || targets=(document formula protocol selection)
build="$root/build-fuzz"
sanitize="-fsanitize=fuzzer-no-link,address,undefined -fno-omit-frame-pointer -g"

CC=clang CXX=clang++ cmake -S "$root" -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=Release \
    -DLUDMOX_FUZZ=ON -DLUDMOX_TESTS=OFF -DLUDMOX_EXAMPLES=OFF \
    -DCMAKE_C_FLAGS="$sanitize" -DCMAKE_CXX_FLAGS="$sanitize" >/dev/null
nice cmake --build "$build" --target "${targets[@]/#/fuzz_}"

mkdir -p "$build/artifacts" "$build/scratch"
export QT_QPA_PLATFORM=offscreen
export ASAN_OPTIONS=${ASAN_OPTIONS:-detect_leaks=1}
export UBSAN_OPTIONS=${UBSAN_OPTIONS:-print_stacktrace=1:halt_on_error=1}

run() {
    local target=$1
    local corpus="$root/tests/data/fuzz/$target"
    local grown="$build/grown/$target"
    mkdir -p "$corpus" "$grown"
    echo "fuzz_$target: running ${seconds}s"
    # The run grows its own directory; the committed corpus only takes what adds coverage.
    (cd "$build/scratch" && "$build/fuzz/fuzz_$target" -max_total_time="$seconds" -timeout=20 \
        -rss_limit_mb=4096 -max_len=8192 -print_final_stats=1 \
        -artifact_prefix="$build/artifacts/$target-" "$grown" "$corpus") \
        >"$build/fuzz_$target.log" 2>&1 || echo "fuzz_$target: FAILED, see $build/fuzz_$target.log"
    (cd "$build/scratch" && "$build/fuzz/fuzz_$target" -merge=1 -timeout=20 "$corpus" "$grown") \
        >>"$build/fuzz_$target.log" 2>&1 || echo "fuzz_$target: merge failed"
    grep -E "stat::number_of_executed_units|SUMMARY|ERROR" "$build/fuzz_$target.log" \
        | sed "s/^/fuzz_$target: /" || true
    echo "fuzz_$target: corpus now $(find "$corpus" -type f | wc -l) files"
}

pids=()
for target in "${targets[@]}"; do
    run "$target" &
    pids+=($!)
    if [[ ${#pids[@]} -ge 2 ]]; then
        wait "${pids[0]}"
        pids=("${pids[@]:1}")
    fi
done
for pid in "${pids[@]}"; do
    wait "$pid"
done
