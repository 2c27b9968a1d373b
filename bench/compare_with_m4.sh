#!/usr/bin/env bash
# Runs ovmacro and GNU m4 side by side on the same work and reports, for each workload, the median wall and
# CPU times, the throughput, the peak resident memory and the speed-up of ovmacro over m4 (m4's time divided
# by ovmacro's), all measured in this one run.
#
# Needs: GNU m4 and /usr/bin/time (scripts/install-deps.sh installs m4; this script installs nothing), and
# gnuplot for the plot (scripts/setup.sh installs it; without it the plot is left out). It builds ovmacro in
# Release into build/bench and writes its inputs and outputs into a temporary directory, removed at the end.
# Usage: bench/compare_with_m4.sh   (RUNS=N sets the timed runs per tool, default 7; PLOT=FILE.svg where the
# plot of time against input size goes, default bench/compare_with_m4.svg, which the README shows; PLOT_RUNS=N
# the runs per point, default 3)
#
# Workloads (the two tools must produce byte-identical outputs, which is checked):
#   plain text    40 MB of words, digits and punctuation without directives, which both tools copy unchanged
#                 (m4 runs with -P, so its builtins are m4_ prefixed, and the text avoids its quote
#                 characters and comment character);
#   plain, after a definition   the same text after one macro definition, which no word of it uses: ovmacro
#                 then looks every word up in its filter of defined names, which it skips while there is none;
#   macro calls   500,000 lines "x greet(aN, b) y" after a two-argument definition:
#                 ovmacro  @def greet(a, b) = {Hello a and b!}
#                 m4       m4_define(`greet', `Hello $1 and $2!')
#   loop          one loop of 100,000 iterations writing "item N": ovmacro @for over a literal list of
#                 100,000 items; m4 a recursive counting loop (m4_define/m4_ifelse/m4_incr), linear in GNU m4,
#                 where a recursive foreach over a literal list would re-copy the rest of the list at every
#                 step and take quadratic time;
#   conditionals  200,000 loop-free lines: per group of four, a bool variable set, an int counter advanced,
#                 a conditional on the bool that writes a string variable and the counter, and a plain line.
#                 ovmacro uses @let and @if(flag){...}@else{...}; m4 uses m4_define, m4_incr and m4_ifelse;
#   table         one list of 20,000 (identifier, display name) tuples made into an enum and a table of string
#                 literals: ovmacro with two @for((id, name) in ENTRIES) blocks, the second writing @str(name);
#                 m4 the m4 way, a file of ENTRY(id, name) lines included twice under two definitions of ENTRY;
#   start-up      a two-line template (one definition, one use), run STARTS times in a row per sample, in
#                 STARTUP_PAIRS alternating samples (defaults 20 and 31): the wall time per run, and the page
#                 faults of one run;
#   plain sizes   the plain text at 40, 80, 160 and 200 MB (the 40 MB text repeated): wall time, peak RSS,
#                 and how the time grows with the size (3 alternating runs each).
# Each tool runs RUNS times, alternating with the other (after one untimed run each). ovmacro writes its
# output with -o, m4 to its standard output, each into a new file: before each timed run the previous output is
# removed and the file system synced (outside the timing), so that neither tool pays for writing back or
# freeing what the other wrote.
set -euo pipefail
export LC_ALL=C  # EPOCHREALTIME with a decimal point
cd "$(dirname "$0")/.."
runs=${RUNS:-7}

for tool in m4 /usr/bin/time; do
  command -v "$tool" >/dev/null || { echo "compare_with_m4: $tool is needed (scripts/install-deps.sh)" >&2; exit 2; }
done

echo "== building ovmacro (Release, build/bench)"
source bench/common.sh
source bench/plot.sh
build_release_ovmacro

work=$(mktemp -d "${TMPDIR:-/tmp}/ovmacro-vs-m4.XXXXXX")
trap 'rm -rf "$work"' EXIT

echo "== generating inputs in $work"
# Plain text: deterministic pseudo-random lines of about 70 characters.
awk -v target=40000000 'BEGIN {
  n = split("lorem ipsum dolor sit amet consectetur adipiscing elit sed do eiusmod tempor incididunt ut " \
            "labore et dolore magna aliqua enim ad minim veniam quis nostrud exercitation ullamco laboris " \
            "nisi aliquip ex ea commodo consequat Duis aute irure in reprehenderit voluptate velit esse " \
            "cillum fugiat nulla pariatur Excepteur sint occaecat cupidatat non proident sunt culpa qui " \
            "officia deserunt mollit anim id est laborum", words, " ")
  split(". , ; : ! ? -", marks, " ")
  seed = 12345; size = 0; line = ""
  while (size < target) {
    seed = (seed * 1103515245 + 12345) % 2147483648
    r = int(seed / 65536)
    if (r % 11 == 0) word = r % 1000
    else if (r % 13 == 0) word = words[r % n + 1] marks[r % 7 + 1]
    else word = words[r % n + 1]
    line = line == "" ? word : line " " word
    if (length(line) > 64) { print line; size += length(line) + 1; line = "" }
  }
}' >"$work/plain.ovm"
cp "$work/plain.ovm" "$work/plain.m4"
plain_bytes=$(stat -c %s "$work/plain.ovm")
{ echo "$greet_definition"; cat "$work/plain.ovm"; } >"$work/plaindef.ovm"
{ echo "m4_define(\`greet', \`Hello \$1 and \$2!')m4_dnl"; cat "$work/plain.ovm"; } >"$work/plaindef.m4"

calls=500000
{
  echo "$greet_definition"
  write_call_lines "$calls"
} >"$work/calls.ovm"
{
  cat <<'EOF'
m4_define(`greet', `Hello $1 and $2!')m4_dnl
EOF
  write_call_lines "$calls"
} >"$work/calls.m4"

items=100000
{
  echo 'before'
  printf '@for(x in ['
  seq -s ', ' "$items" | tr -d '\n'
  printf ']){\nitem x\n}\n'
  echo 'after'
} >"$work/loop.ovm"
# forloop(NAME, FIRST, LAST, TEXT): TEXT once for each value of NAME from FIRST to LAST. The recursive call
# ends the expansion of each step, so m4 runs it in constant space.
sed "s/@ITEMS@/$items/" >"$work/loop.m4" <<'EOF'
m4_define(`forloop', `m4_pushdef(`$1', `$2')_forloop($@)m4_popdef(`$1')')m4_dnl
m4_define(`_forloop', `$4`'m4_ifelse($1, `$3', `', `m4_define(`$1', m4_incr($1))$0($@)')')m4_dnl
before
forloop(`x', `1', `@ITEMS@', `item x
')
after
EOF

lines=200000
groups=$((lines / 4))
awk -v groups="$groups" 'BEGIN {
  print "@let bool flag = false"; print "@let int n = 0"; print "@let string label := alpha"
  for (i = 1; i <= groups; i++) {
    print "@let flag = " (i % 3 == 0 ? "false" : "true")
    print "@let n = n + 1"
    print "@if(flag){label on n}@else{label off n}"
    print "plain text of group " i
  }
}' >"$work/cond.ovm"
awk -v groups="$groups" -v q="'" 'BEGIN {
  print "m4_define(`flag" q ", `false" q ")m4_dnl"; print "m4_define(`n" q ", `0" q ")m4_dnl"
  print "m4_define(`label" q ", `alpha" q ")m4_dnl"
  for (i = 1; i <= groups; i++) {
    print "m4_define(`flag" q ", `" (i % 3 == 0 ? "false" : "true") q ")m4_dnl"
    print "m4_define(`n" q ", m4_incr(n))m4_dnl"
    print "m4_ifelse(flag, `true" q ", `label on n" q ", `label off n" q ")"
    print "plain text of group " i
  }
}' >"$work/cond.m4"

entries=20000
awk -v n="$entries" 'BEGIN {
  printf "@def ENTRIES = ["
  for (i = 0; i < n; i++) printf "%s(E%d, `name %d \"q\"`)", i ? ", " : "", i, i
  print "]"
  print "enum class Color {"
  print "    @for((id, name) in ENTRIES)"; print "    {"; print "        id,"; print ""; print "    }@//"
  print "};"
  print "static const char* const kNames[] = {"
  print "    @for((id, name) in ENTRIES)"; print "    {"; print "        @str(name),"; print ""; print "    }@//"
  print "};"
}' >"$work/table.ovm"
awk -v n="$entries" -v q="'" 'BEGIN {
  for (i = 0; i < n; i++) printf "ENTRY(E%d, `name %d \\\"q\\\"%s)m4_dnl\n", i, i, q
}' >"$work/entries.m4"
cat >"$work/table.m4" <<'EOF'
enum class Color {
m4_define(`ENTRY', `    $1,
')m4_dnl
m4_include(`entries.m4')m4_dnl
};
static const char* const kNames[] = {
m4_define(`ENTRY', `    "$2",
')m4_dnl
m4_include(`entries.m4')m4_dnl
};
EOF

printf '@def X = {1}\nX\n' >"$work/start.ovm"
printf 'm4_define(`X'"'"', `1'"'"')m4_dnl\nX\n' >"$work/start.m4"

# run OUTPUT_FILE COMMAND...: runs once with output to the file; sets wall and cpu (user + system) in seconds,
# read by the shell itself (EPOCHREALTIME, times), so that a wrapper's start adds nothing to short runs. CPU time
# says more than wall time on a machine that other work shares.
run() {
  local out=$1
  shift
  times >"$work/times.before"
  local start=$EPOCHREALTIME
  "$@" >"$out" || {
    echo "compare_with_m4: failed: $*" >&2
    exit 1
  }
  local end=$EPOCHREALTIME
  times >"$work/times.after"
  wall=$(awk -v a="$start" -v b="$end" 'BEGIN { printf "%.4f", b - a }')
  # The second line of times: the children's user and system times, as 0m1.234s.
  cpu=$(awk 'function s(t) { split(t, p, "m"); return p[1] * 60 + p[2] }
             FNR == 2 { c[FILENAME] = s($1) + s($2) } END { printf "%.3f", c[ARGV[2]] - c[ARGV[1]] }' \
    "$work/times.before" "$work/times.after")
}

# peak_rss OUTPUT_FILE COMMAND...: one more run, under /usr/bin/time; sets rss (KB).
peak_rss() {
  local out=$1
  shift
  /usr/bin/time -f '%M' -o "$work/time" "$@" >"$out" || {
    echo "compare_with_m4: failed: $*" >&2
    exit 1
  }
  rss=$(tail -n 1 "$work/time")
}

# fresh FILE...: removes the files and writes back whatever waits to be written, before a timed run.
fresh() {
  rm -f "$@"
  sync
}

median() { sort -g | awk '{ v[NR] = $1 } END { print (NR % 2) ? v[(NR + 1) / 2] : (v[NR / 2] + v[NR / 2 + 1]) / 2 }'; }

printf '\n%-13s %-8s %8s %8s %18s %12s\n' workload tool 'wall s' 'cpu s' 'throughput' 'peak RSS MB'
# bench NAME LABEL UNITS UNIT: times $work/NAME.ovm (ovmacro) against $work/NAME.m4 (m4 -P); the throughput
# is UNITS per second (UNIT "MB": bytes, shown as MB/s).
bench() {
  local name=$1 label=$2 units=$3 unit=$4 i input_bytes
  input_bytes=$(stat -c %s "$work/$name.ovm")
  local -a ov_wall=() m4_wall=() ov_cpu=() m4_cpu=()
  local ovr m4r
  peak_rss /dev/null "$ovmacro" -o "$work/$name.ovmacro.out" "$work/$name.ovm"
  ovr=$rss
  peak_rss "$work/$name.m4.out" m4 -P -I "$work" "$work/$name.m4"
  m4r=$rss
  cmp -s "$work/$name.ovmacro.out" "$work/$name.m4.out" || {
    echo "compare_with_m4: $name: the outputs of ovmacro and m4 differ" >&2
    diff "$work/$name.ovmacro.out" "$work/$name.m4.out" | head -n 10 >&2
    exit 1
  }
  for ((i = 0; i < runs; i++)); do
    fresh "$work/$name.ovmacro.out"
    run /dev/null "$ovmacro" -o "$work/$name.ovmacro.out" "$work/$name.ovm"
    ov_wall+=("$wall") ov_cpu+=("$cpu")
    fresh "$work/$name.m4.out"
    run "$work/$name.m4.out" m4 -P -I "$work" "$work/$name.m4"
    m4_wall+=("$wall") m4_cpu+=("$cpu")
  done
  local ovw m4w ovc m4c
  ovw=$(printf '%s\n' "${ov_wall[@]}" | median)
  m4w=$(printf '%s\n' "${m4_wall[@]}" | median)
  ovc=$(printf '%s\n' "${ov_cpu[@]}" | median)
  m4c=$(printf '%s\n' "${m4_cpu[@]}" | median)
  awk -v name="$label" -v units="$units" -v unit="$unit" -v ovw="$ovw" -v m4w="$m4w" -v ovc="$ovc" -v m4c="$m4c" \
    -v ovr="$ovr" -v m4r="$m4r" -v bytes="$input_bytes" '
    function rate(t) { return unit == "MB" ? sprintf("%.1f MB/s", units / 1e6 / t) : sprintf("%.0f %s/s", units / t, unit) }
    function times(a, b) { return b > 0 ? sprintf("%.2fx", a / b) : "-" }
    BEGIN {
      printf "%-13s %-8s %8.3f %8.2f %18s %12.1f\n", name, "ovmacro", ovw, ovc, rate(ovw), ovr / 1024
      printf "%-13s %-8s %8.3f %8.2f %18s %12.1f\n", "", "m4", m4w, m4c, rate(m4w), m4r / 1024
      printf "%-13s %-8s %8s %8s %18s %12s\n", "", "speed-up", times(m4w, ovw), times(m4c, ovc), "", ""
      printf "%-13s %-8s %8s %8s %18s %12s\n", "", "memory", "", "", "", sprintf("%.2fx input", ovr * 1024 / bytes)
    }'
}

bench plain 'plain text' "$plain_bytes" MB
cmp -s "$work/plain.ovm" "$work/plain.ovmacro.out" || { echo "compare_with_m4: plain text changed" >&2; exit 1; }
bench plaindef 'plain, def' "$plain_bytes" MB
bench calls 'macro calls' "$calls" calls
bench loop 'loop' "$items" items
bench cond 'conditionals' "$lines" lines
bench table 'table' "$entries" entries

# The start of the process, which a build that generates thousands of small files pays thousands of times:
# STARTS runs in a row per sample (the clock read once per sample), samples alternating between the tools.
startup() {
  local starts=${STARTS:-20} pairs=${STARTUP_PAIRS:-31} i k start end
  "$ovmacro" -o "$work/start.ovmacro.out" "$work/start.ovm"
  m4 -P "$work/start.m4" >"$work/start.m4.out"
  cmp -s "$work/start.ovmacro.out" "$work/start.m4.out" || { echo "compare_with_m4: start-up outputs differ" >&2; exit 1; }
  local -a ov=() m4t=()
  for ((i = 0; i < pairs; i++)); do
    start=$(date +%s%N)
    for ((k = 0; k < starts; k++)); do "$ovmacro" -o "$work/start.ovmacro.out" "$work/start.ovm"; done
    end=$(date +%s%N)
    ov+=("$(((end - start) / starts))")
    start=$(date +%s%N)
    for ((k = 0; k < starts; k++)); do m4 -P "$work/start.m4" >"$work/start.m4.out"; done
    end=$(date +%s%N)
    m4t+=("$(((end - start) / starts))")
  done
  local ovm m4m ovf m4f spread
  ovm=$(printf '%s\n' "${ov[@]}" | median)
  m4m=$(printf '%s\n' "${m4t[@]}" | median)
  ovf=$(/usr/bin/time -f %R "$ovmacro" -o "$work/start.ovmacro.out" "$work/start.ovm" 2>&1)
  ovf=${ovf##*$'\n'}
  m4f=$( { /usr/bin/time -f %R m4 -P "$work/start.m4" >/dev/null; } 2>&1)
  spread=$(printf '%s\n' "${ov[@]}" | sort -n | awk 'NR == 1 { lo = $1 } { hi = $1 } END { printf "%.2f-%.2f", lo / 1e6, hi / 1e6 }')
  spread="$spread / $(printf '%s\n' "${m4t[@]}" | sort -n | awk 'NR == 1 { lo = $1 } { hi = $1 } END { printf "%.2f-%.2f", lo / 1e6, hi / 1e6 }')"
  echo
  printf '%-13s %-8s %12s %12s\n' start-up tool 'ms per run' 'page faults'
  awk -v ovm="$ovm" -v m4m="$m4m" -v ovf="$ovf" -v m4f="$m4f" -v spread="$spread" 'BEGIN {
    printf "%-13s %-8s %12.2f %12d\n", "two lines", "ovmacro", ovm / 1e6, ovf
    printf "%-13s %-8s %12.2f %12d\n", "", "m4", m4m / 1e6, m4f
    printf "%-13s %-8s %11.2fx %12s\n", "", "speed-up", m4m / ovm, ""
    printf "%-13s %-8s %12s\n", "", "spread", "ms min-max, ovmacro / m4: " spread
  }'
}
startup

# The plain text at growing sizes: whether the time stays proportional to the input and the memory to it.
sizes() {
  local mult i copies
  echo
  printf '%-13s %-8s %8s %8s %12s %14s\n' 'plain sizes' tool 'wall s' 'cpu s' 'peak RSS MB' 'RSS / input'
  for mult in 1 2 4 5; do
    : >"$work/big.ovm"
    for ((copies = 0; copies < mult; copies++)); do cat "$work/plain.ovm" >>"$work/big.ovm"; done
    local bytes
    bytes=$(stat -c %s "$work/big.ovm")
    local -a ow=() oc=() mw=() mc=()
    local orss mrss
    peak_rss /dev/null "$ovmacro" -o "$work/big.ovmacro.out" "$work/big.ovm"
    orss=$rss
    peak_rss "$work/big.m4.out" m4 -P "$work/big.ovm"
    mrss=$rss
    for ((i = 0; i < 3; i++)); do
      fresh "$work/big.ovmacro.out"
      run /dev/null "$ovmacro" -o "$work/big.ovmacro.out" "$work/big.ovm"
      ow+=("$wall") oc+=("$cpu")
      fresh "$work/big.m4.out"
      run "$work/big.m4.out" m4 -P "$work/big.ovm"
      mw+=("$wall") mc+=("$cpu")
    done
    cmp -s "$work/big.ovm" "$work/big.ovmacro.out" || { echo "compare_with_m4: plain text changed" >&2; exit 1; }
    awk -v mb=$((bytes / 1000000)) -v bytes="$bytes" -v ow="$(printf '%s\n' "${ow[@]}" | median)" \
      -v oc="$(printf '%s\n' "${oc[@]}" | median)" -v orss="$orss" \
      -v mw="$(printf '%s\n' "${mw[@]}" | median)" -v mc="$(printf '%s\n' "${mc[@]}" | median)" \
      -v mrss="$mrss" 'BEGIN {
      printf "%-13s %-8s %8.3f %8.2f %12.1f %13.2fx\n", mb " MB", "ovmacro", ow, oc, orss / 1024, orss * 1024 / bytes
      printf "%-13s %-8s %8.3f %8.2f %12.1f %13.2fx\n", "", "m4", mw, mc, mrss / 1024, mrss * 1024 / bytes
    }'
    rm -f "$work/big.ovmacro.out" "$work/big.m4.out"
  done
  rm -f "$work/big.ovm"
}
sizes

echo
echo "median of $runs alternating runs per tool; peak RSS of one more run; speed-up = m4 time / ovmacro time"
echo "time (wall and cpu = user + system); memory = ovmacro's peak RSS / its input's size;"
echo "outputs of the two tools were identical for every workload; ovmacro $("$ovmacro" --version | awk '{ print $2 }'), $(m4 --version | head -n 1)"
echo
plot_time_against_size "${PLOT:-bench/compare_with_m4.svg}"
