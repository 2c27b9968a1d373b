# The plot of bench/compare_with_m4.sh (sourced by it, from the project root): the time of ovmacro and of GNU
# m4 against the size of their input, for plain text and for macro calls, drawn with gnuplot as SVG.

# plot_time_against_size SVG: times both tools on the first eighth, quarter, half and all of the plain text
# ($work/plain.ovm) and of the call lines (at most $calls), median of $plot_runs runs each, writes the
# table of points to $work/points.txt and draws SVG from it. Uses run, fresh, median and $ovmacro of the
# script.
plot_time_against_size() {
  local svg=$1 plot_runs=${PLOT_RUNS:-3}
  if ! command -v gnuplot >/dev/null; then
    echo "compare_with_m4: no plot: gnuplot is needed (scripts/setup.sh installs it)" >&2
    return 0
  fi
  local lines part size i workload
  lines=$(wc -l <"$work/plain.ovm")
  : >"$work/points.txt"
  for part in 1 2 4 8; do
    head -n $((lines * part / 8)) "$work/plain.ovm" >"$work/plain-part.ovm"
    cp "$work/plain-part.ovm" "$work/plain-part.m4"
    {
      echo "$greet_definition"
      write_call_lines $((calls * part / 8))
    } >"$work/calls-part.ovm"
    {
      echo "m4_define(\`greet', \`Hello \$1 and \$2!')m4_dnl"
      write_call_lines $((calls * part / 8))
    } >"$work/calls-part.m4"
    for workload in plain calls; do
      size=$(stat -c %s "$work/$workload-part.ovm")
      local -a ov=() m4=()
      for ((i = 0; i < plot_runs; i++)); do
        fresh "$work/part.out"
        run /dev/null "$ovmacro" -o "$work/part.out" "$work/$workload-part.ovm"
        ov+=("$wall")
        fresh "$work/part.out"
        run "$work/part.out" m4 -P "$work/$workload-part.m4"
        m4+=("$wall")
      done
      echo "$workload $size $(printf '%s\n' "${ov[@]}" | median) $(printf '%s\n' "${m4[@]}" | median)" \
        >>"$work/points.txt"
    done
  done
  grep '^plain' "$work/points.txt" >"$work/plain.points"
  grep '^calls' "$work/points.txt" >"$work/calls.points"
  gnuplot <<EOF
set terminal svg size 720,420 dynamic font "sans,13" background rgb "white"
set output "$svg"
set title "Wall time against input size (median of $plot_runs runs)"
set xlabel "input size (MB)"
set ylabel "time (s)"
set key top left
set grid
set xrange [0:*]
set yrange [0:*]
plot "$work/plain.points" using (\$2/1e6):4 with linespoints lw 2 pt 7 lc rgb "#b2182b" title "GNU m4, plain text", \
     "$work/calls.points" using (\$2/1e6):4 with linespoints lw 2 pt 5 lc rgb "#ef8a62" title "GNU m4, macro calls", \
     "$work/plain.points" using (\$2/1e6):3 with linespoints lw 2 pt 7 lc rgb "#2166ac" title "ovmacro, plain text", \
     "$work/calls.points" using (\$2/1e6):3 with linespoints lw 2 pt 5 lc rgb "#67a9cf" title "ovmacro, macro calls"
EOF
  echo "plot of time against input size: $svg"
}
