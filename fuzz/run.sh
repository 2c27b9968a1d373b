#!/usr/bin/env bash
# Builds the fuzz targets with clang (libFuzzer, AddressSanitizer, UndefinedBehaviorSanitizer) and runs each
# for the given number of seconds, two at a time, with the dictionary and the seed corpus.
#
#     fuzz/run.sh SECONDS [TARGET...]        (targets: token_scanner section_scanners expression_parser
#                                              macro_expand mpfw_reading; all by default)
#
# The build directory is build-fuzz beside the sources, or $OVMACRO_FUZZ_BUILD_DIR. In it, new inputs go to
# fuzz-corpus/<target> (the committed seeds in fuzz/corpus/<target> are only read), crashes, timeouts and
# leaks to fuzz-artifacts/<target>-*, and each run's log to fuzz-logs/<target>.log. $OVMACRO_FUZZ_JOBS sets
# how many targets run at once (2). With OVMACRO_FUZZ_KEEP_GOING=1 a target goes on after a fault (libFuzzer's
# fork mode), so that one run collects every fault it meets. At the end a line per target gives its executions
# and coverage (cov, ft) from libFuzzer's final statistics; the script fails if any target found a fault.
#
# The fuzzers run from a copy of the programs and the library (fuzz-bin), so that a rebuild of the library
# while they run cannot mix two versions of it.
set -euo pipefail

if [[ $# -lt 1 || ! $1 =~ ^[0-9]+$ ]]; then
    echo "usage: $0 SECONDS [TARGET...]" >&2
    exit 2
fi
seconds=$1
shift
source_dir=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)
build_dir=${OVMACRO_FUZZ_BUILD_DIR:-$source_dir/build-fuzz}
jobs=${OVMACRO_FUZZ_JOBS:-2}
targets=("$@")
if [[ ${#targets[@]} -eq 0 ]]; then
    targets=(token_scanner section_scanners expression_parser macro_expand mpfw_reading)
fi

CC=${CC:-clang} CXX=${CXX:-clang++} cmake -S "$source_dir" -B "$build_dir" -DOVMACRO_BUILD_FUZZERS=ON \
    -DOVMACRO_BUILD_BENCHMARKS=OFF >/dev/null
nice -n 10 cmake --build "$build_dir" -j2 --target "${targets[@]/%/_fuzzer}"

bin=$build_dir/fuzz-bin
rm -rf "$bin"
mkdir -p "$bin" "$build_dir/fuzz-logs" "$build_dir/fuzz-artifacts"
cp -P "$build_dir"/src/libovMacroExpander.so* "$bin"/
for target in "${targets[@]}"; do cp "$build_dir/fuzz/${target}_fuzzer" "$bin"/; done

keep_going=()
if [[ ${OVMACRO_FUZZ_KEEP_GOING:-0} == 1 ]]; then
    keep_going=(-fork=1 -ignore_crashes=1 -ignore_timeouts=1 -ignore_ooms=1)
fi
run_target() {
    local target=$1
    local corpus=$build_dir/fuzz-corpus/$target
    mkdir -p "$corpus"
    # -close_fd_mask=3: what the inputs print (@print, reports of failed files) is noise here; libFuzzer
    # keeps its own output and the sanitizers' reports.
    LD_LIBRARY_PATH=$bin nice -n 10 "$bin/${target}_fuzzer" "$corpus" "$source_dir/fuzz/corpus/$target" \
        -dict="$source_dir/fuzz/ovmacro.dict" -max_total_time="$seconds" -max_len=4096 -timeout=10 \
        -rss_limit_mb=2048 -close_fd_mask=3 -print_final_stats=1 "${keep_going[@]}" \
        -artifact_prefix="$build_dir/fuzz-artifacts/$target-" >"$build_dir/fuzz-logs/$target.log" 2>&1
}

# Faults show as new files in fuzz-artifacts (in fork mode libFuzzer ends normally after finding some).
artifacts_before=$(ls "$build_dir/fuzz-artifacts" | sort)
failed=0
pids=()
names=()
for target in "${targets[@]}"; do
    while [[ $(jobs -rp | wc -l) -ge $jobs ]]; do sleep 1; done
    echo "fuzzing $target for ${seconds}s"
    run_target "$target" &
    pids+=($!)
    names+=("$target")
done
for i in "${!pids[@]}"; do
    if ! wait "${pids[$i]}"; then
        echo "${names[$i]}: FAULT FOUND, see $build_dir/fuzz-logs/${names[$i]}.log" >&2
        failed=1
    fi
done

echo
printf '%-18s %12s %8s %8s\n' target executions cov ft
for target in "${targets[@]}"; do
    log=$build_dir/fuzz-logs/$target.log
    # The last status line ("#RUNS DONE cov: ..." at a clean end, "#RUNS: cov: ..." in fork mode) carries
    # the final coverage.
    status=$(grep -E '^#[0-9]+' "$log" | tail -1 || true)
    runs=$(sed -n 's/^stat::number_of_executed_units: *//p' "$log" | tail -1)
    [[ -n $runs ]] || runs=$(sed -n 's/^#\([0-9]*\).*/\1/p' <<<"$status")
    cov=$(sed -n 's/.* cov: \([0-9]*\).*/\1/p' <<<"$status")
    ft=$(sed -n 's/.* ft: \([0-9]*\).*/\1/p' <<<"$status")
    printf '%-18s %12s %8s %8s\n' "$target" "${runs:-?}" "${cov:-?}" "${ft:-?}"
done
new_artifacts=$(comm -13 <(echo "$artifacts_before") <(ls "$build_dir/fuzz-artifacts" | sort))
if [[ -n $new_artifacts ]]; then
    sed "s|^|fault: $build_dir/fuzz-artifacts/|" <<<"$new_artifacts"
    failed=1
fi
exit $failed
