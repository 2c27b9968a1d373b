#!/usr/bin/env bash
# Limits under load: expands large or deep inputs with a Release build of ovmacro and prints, for each, the
# exit status, the wall time, the peak resident memory (from /usr/bin/time -v), the size of the output and the
# first line of any error. Then starts and stops the embedded Python interpreter 100 times in one process
# (every other block raising) and prints the resident memory across the cycles.
#
#     cmake -S . -B build-release -DCMAKE_BUILD_TYPE=Release && cmake --build build-release --target ovmacro
#     bench/limits.sh [-b BUILD_DIR] [-k]     (BUILD_DIR defaults to build-release; -k keeps the inputs)
#
# Every input must expand or fail with a clear error; a crash (exit status above 128) is flagged. The figures
# are wall-clock times on whatever else the machine is doing: compare runs made under the same load. No test
# asserts them.
set -euo pipefail

repo="$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)"
build="$repo/build-release"
keep=0
while getopts "b:k" opt; do
    case "$opt" in
        b) build="$(cd "$OPTARG" && pwd)" ;;
        k) keep=1 ;;
        *) exit 2 ;;
    esac
done
tool="$build/tools/ovmacro/ovmacro"
if [[ ! -x "$tool" ]]; then
    echo "limits.sh: no ovmacro in $build (see the usage at the top of this script)" >&2
    exit 2
fi
if ! grep -q '^CMAKE_BUILD_TYPE:STRING=Release$' "$build/CMakeCache.txt" 2>/dev/null; then
    echo "limits.sh: warning: $build is not a Release build; the figures will not be representative" >&2
fi

work="$(mktemp -d "${TMPDIR:-/tmp}/ovmacro-limits.XXXXXX")"
if [[ $keep == 0 ]]; then trap 'rm -rf "$work"' EXIT; else echo "inputs kept in $work"; fi

# ---- Inputs ------------------------------------------------------------------------------------------------
python3 - "$work" <<'EOF'
import sys, os
work = sys.argv[1]
def write(name, text):
    with open(os.path.join(work, name), "w") as f:
        f.write(text)

# 200 MB of ordinary text: words, numbers, punctuation, strings and comments on 64-character lines.
line = 'Lorem ipsum dolor sit amet, x_1 = (42 + 7) * 3; "a string" // c\n'
with open(os.path.join(work, "text_200mb.txt"), "w") as f:
    block = line * 16384
    for _ in range(200 * 1024 * 1024 // len(block)):
        f.write(block)

# One line of 10 MB.
write("line_10mb.txt", "word " * (2 * 1024 * 1024) + "\n")

# A macro whose body is 1 MB of text on 64-character lines, invoked 10 times.
body = ("text of the 1 MB body, with words, numbers like 123 and operators: a + b;\n" * 14000)
write("body_1mb.txt", "@def big = {\n" + body + "}\n" + "big\n" * 10)

# 100,000 macros with one argument, each defined and then invoked once.
defs = "".join("@def m%d(a) = {<a %d>}\n" % (i, i) for i in range(100000))
calls = "".join("m%d(x)\n" % i for i in range(100000))
write("macros_100k.txt", defs + calls)

# 50,000 nested @scope blocks: far beyond the nesting guard.
write("scope_50k.txt", "@scope{" * 50000 + "x" + "}" * 50000 + "\n")

# A @for over a million items.
write("for_1m.txt", "@for(x in [" + ",".join(str(i) for i in range(1000000)) + "]){x }\n")
EOF

# ---- Runs --------------------------------------------------------------------------------------------------
printf '%-12s %9s %5s %9s %10s %9s  %s\n' "input" "size MB" "exit" "wall s" "peak RSS MB" "out MB" "first error line"
run() {
    local name="$1" file="$work/$1.txt"
    local timing="$work/$name.time" out="$work/$name.out" err="$work/$name.err"
    local status=0
    /usr/bin/time -v -o "$timing" "$tool" "$file" >"$out" 2>"$err" || status=$?
    local wall rss
    wall="$(sed -n 's/^[[:space:]]*Elapsed (wall clock) time (h:mm:ss or m:ss): //p' "$timing" |
        awk -F: '{ s = 0; for (i = 1; i <= NF; ++i) s = s * 60 + $i; printf "%.2f", s }')"
    rss="$(sed -n 's/^[[:space:]]*Maximum resident set size (kbytes): //p' "$timing" | awk '{ printf "%.1f", $1 / 1024 }')"
    status="$(sed -n 's/^[[:space:]]*Exit status: //p' "$timing")"
    if grep -q "Command terminated by signal" "$timing"; then status="SIGNAL"; fi
    local first
    first="$(grep -v '^$' "$err" | head -1 | sed "s|^$work/||" | cut -c1-100 || true)"
    printf '%-12s %9.1f %5s %9s %10s %9.1f  %s\n' "$name" \
        "$(awk -v s="$(stat -c %s "$file")" 'BEGIN { print s / 1048576 }')" "$status" "$wall" "$rss" \
        "$(awk -v s="$(stat -c %s "$out")" 'BEGIN { print s / 1048576 }')" "$first"
    if [[ "$status" == "SIGNAL" || ( "$status" =~ ^[0-9]+$ && "$status" -gt 128 ) ]]; then
        echo "  CRASH: $name ended with status $status" >&2
    fi
}
for name in text_200mb line_10mb body_1mb macros_100k scope_50k for_1m; do
    run "$name"
done

# ---- Python started and stopped 100 times ------------------------------------------------------------------
echo
echo "Embedded Python, 100 start/stop cycles in one process (every other block raises):"
cxx="${CXX:-c++}"
"$cxx" -std=c++20 -O2 -I"$repo/src" "$repo/bench/limits_python_cycles.cc" -L"$build/src" -lovMacroExpander \
    -Wl,-rpath,"$build/src" -o "$work/limits_python_cycles"
/usr/bin/time -v -o "$work/python.time" "$work/limits_python_cycles" 100
sed -n 's/^[[:space:]]*\(Elapsed (wall clock) time.*\|Maximum resident set size.*\)/  \1/p' "$work/python.time"
