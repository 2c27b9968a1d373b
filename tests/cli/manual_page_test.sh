#!/bin/sh
# The manual page renders with man, without a warning from the formatter, and lists exactly the options that
# --help lists. Usage: manual_page_test.sh OVMACRO PAGE (exit 77, a skip, where no man program exists).
set -eu
tool=$1 page=$2
command -v man >/dev/null 2>&1 || { echo "skipped: no man program"; exit 77; }
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

LC_ALL=C MANWIDTH=80 man --warnings=all -l "$page" >"$work/page" 2>"$work/warnings"
if [ -s "$work/warnings" ]; then echo "man -l $page warned:"; cat "$work/warnings"; exit 1; fi
for heading in NAME SYNOPSIS DESCRIPTION OPTIONS 'THE LANGUAGE AT A GLANCE' DIAGNOSTICS 'EXIT STATUS' EXAMPLES; do
  grep -qx "$heading" "$work/page" || { echo "no section $heading in the page"; exit 1; }
done
# The option lines: "  -o, --output=OUT" in --help, "       -o, --output=OUT" in the page; also the forms
# "--trace[=NAME,...]" and "-WNAME".
form='((-[a-zA-Z], )?--[a-z-]+(=[A-Z=]+|\[=[A-Z,.]+\])?|-[a-zA-Z][A-Z]+)'
"$tool" --help | grep -E "^  ((-[a-zA-Z], |    )--|-[a-zA-Z][A-Z])" | sed 's/^ *//; s/  .*//' | sort >"$work/help-options"
# (A form shorter than the indentation shares its line with the help.)
grep -E "^       $form(\$| )" "$work/page" | sed -E "s/^ *($form).*/\\1/" | sort >"$work/page-options"
[ -s "$work/help-options" ] || { echo "no option found in --help"; exit 1; }
diff "$work/help-options" "$work/page-options" || { echo "--help and the page list different options"; exit 1; }
