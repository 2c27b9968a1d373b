#!/usr/bin/env bash
# Rewrites the expected reports of the error cases in tests/golden/errors from what ovmacro reports now.
#
#     tests/golden/refresh.sh [-t PATH/TO/ovmacro] [CASE...]
#
# Without CASE names every case is refreshed. Run it after a reviewed change of a message, then read the diff
# of the .expected files before committing them. A case whose report does not begin with the file and line
# named on its "// expect:" line, or whose exit status is not 1, is listed as a warning: its expectation is
# written anyway, so that the diff shows what changed, but the test will fail until the case or the library
# is put right. The "// expect:" lines are never rewritten; they are the reviewed locations.
set -euo pipefail

here="$(cd "$(dirname "${BASH_SOURCE[0]}")" && pwd)"
cases_dir="$here/errors"
tool="${OVMACRO:-$here/../../build/tools/ovmacro/ovmacro}"
if [[ "${1:-}" == "-t" ]]; then
    tool="$2"
    shift 2
fi
if [[ ! -x "$tool" ]]; then
    echo "refresh.sh: no ovmacro at $tool (give it with -t PATH or OVMACRO=PATH)" >&2
    exit 2
fi
tool="$(cd "$(dirname "$tool")" && pwd)/$(basename "$tool")"

if [[ $# -gt 0 ]]; then
    names=("$@")
else
    names=()
    for f in "$cases_dir"/*.ovm; do
        n="$(basename "$f")"
        names+=("${n%.ovm}")
    done
fi

# Same environment as the test, so that an AddressSanitizer build of the tool reports no leaks of Python's
# own allocator (see error_locations_test.cc).
export PYTHONMALLOC=malloc

warnings=0
cd "$cases_dir"
for name in "${names[@]}"; do
    file="$name.ovm"
    if [[ ! -f "$file" ]]; then
        echo "refresh.sh: no case $file" >&2
        exit 2
    fi
    expect="$(sed -n '1s|^// expect: ||p' "$file")"
    args=()
    stdin=0
    while IFS= read -r line; do
        case "$line" in
            "// args: "*) read -r -a args <<<"${line#// args: }" ;;
            "// stdin") stdin=1 ;;
        esac
    done < <(sed -n '2,3p' "$file")
    status=0
    if [[ $stdin == 1 ]]; then
        "$tool" "${args[@]}" - <"$file" >/dev/null 2>"$name.expected" || status=$?
    else
        "$tool" "${args[@]}" "$file" >/dev/null 2>"$name.expected" </dev/null || status=$?
    fi
    report="$(head -c $((${#expect} + 4)) "$name.expected" | tail -c +2)"
    if [[ $status != 1 || "$report" != "$expect : " ]]; then
        echo "warning: $name: exit status $status, report begins '${report}', expected '$expect : '" >&2
        warnings=$((warnings + 1))
    fi
done
echo "refreshed ${#names[@]} case(s), $warnings warning(s)"
