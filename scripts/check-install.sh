#!/usr/bin/env bash
# Checks the installed package as a consumer sees it: builds the project (in BUILD_DIR, default
# build/install-check; an existing build such as build/test is reused), installs it into a temporary prefix
# given only at install time (so the installed files must be relocatable), then
#   - runs the installed ovmacro (it must find the library beside it and print the project version);
#   - builds examples/host against the installed CMake package (find_package, CMAKE_PREFIX_PATH) and runs it
#     on its sample description, comparing the output with examples/host/project.expected, and on a faulty
#     description, which must fail with a FILE(LINE) report;
#   - builds the same host with the flags of `pkg-config --cflags --libs ovMacroExpander` (PKG_CONFIG_PATH)
#     and runs it again;
#   - builds examples/generate, which generates a header with ovmacro_generate() from a template importing a
#     second file, with Make and with Ninja against the installed package, and with Ninja from the source tree
#     (add_subdirectory); runs its program, then checks that touching or editing the imported file
#     regenerates the header, and that a build without a change regenerates nothing.
# Usage: scripts/check-install.sh [BUILD_DIR]
set -euo pipefail
cd "$(dirname "$0")/.."
root=$PWD
build=${1:-build/install-check}

work=$(mktemp -d "${TMPDIR:-/tmp}/ovmacro-install-check.XXXXXX")
trap 'rm -rf "$work"' EXIT
prefix=$work/prefix

fail() {
  echo "check-install: $*" >&2
  exit 1
}

echo "== build ($build)"
if [ ! -f "$build/CMakeCache.txt" ]; then
  cmake -S . -B "$build" -DCMAKE_BUILD_TYPE=RelWithDebInfo -DOVMACRO_BUILD_TESTS=OFF -DOVMACRO_BUILD_BENCHMARKS=OFF
fi
cmake --build "$build" -j"$(nproc)" --target ovMacroExpander ovmacro
command -v ninja >/dev/null || fail "ninja is needed (scripts/install-deps.sh installs it)"

echo "== install into $prefix"
cmake --install "$build" --prefix "$prefix" >"$work/install.log"
version=$(sed -n 's/^CMAKE_PROJECT_VERSION:STATIC=//p' "$build/CMakeCache.txt")
[ -n "$version" ] || fail "no project version in $build/CMakeCache.txt"
libdir=$(dirname "$(find "$prefix" -name 'libovMacroExpander.so' -print -quit)")
[ -d "$libdir" ] || fail "libovMacroExpander.so was not installed"
for f in "$prefix/include/ovmacro/ovMacroExpander.h" "$prefix/include/ovmacro/mpfw/mpfw_parser.h" \
  "$libdir/libovMacroExpander.so.$version" "$libdir/cmake/ovMacroExpander/ovMacroExpanderConfig.cmake" \
  "$libdir/cmake/ovMacroExpander/ovMacroExpanderConfigVersion.cmake" "$libdir/pkgconfig/ovMacroExpander.pc" \
  "$libdir/cmake/ovMacroExpander/ovMacroExpanderGenerate.cmake" "$prefix/share/man/man1/ovmacro.1"; do
  [ -e "$f" ] || fail "missing after install: ${f#"$prefix"/}"
done
# A consumer needs only the library and its headers: nothing installed may ask for Python's development files.
if grep -rl -i 'python' "$libdir/cmake" "$libdir/pkgconfig"; then
  fail "the installed package files refer to Python"
fi

echo "== installed ovmacro"
out=$("$prefix/bin/ovmacro" --version)
[ "$out" = "ovmacro $version" ] || fail "ovmacro --version printed '$out', expected 'ovmacro $version'"
out=$(printf '@def greet(who) = {Hello who!}\ngreet(install)\n' | "$prefix/bin/ovmacro")
[ "$out" = "Hello install!" ] || fail "the installed ovmacro expanded to '$out'"
# Python is loaded only when a text uses it, from the bridge module installed beside the library.
if ldd "$prefix/bin/ovmacro" "$libdir/libovMacroExpander.so.$version" | grep -i python; then
  fail "the installed tool or library needs libpython to start"
fi
out=$(printf '@runpython{print("py", 6 * 7)}\n' | "$prefix/bin/ovmacro")
[ "$out" = "py 42" ] || fail "the installed ovmacro ran Python as '$out'"

sample=examples/host/project.ovp
expected=examples/host/project.expected
check_host() {  # check_host LABEL HOST_BINARY
  local label=$1 host=$2
  "$host" "$root/$sample" >"$work/host.out" || fail "$label: the host failed on $sample"
  diff -u "$root/$expected" "$work/host.out" || fail "$label: the host's output differs from $expected"
  # An error must come back as a report against the file and line the user wrote, with exit status 1.
  mkdir -p "$work/faulty"
  cat >"$work/faulty/project.ovp" <<'EOF'
$name = "demo"
$path = "apps/demo/"
EOF
  local status=0
  "$host" "$work/faulty/project.ovp" >/dev/null 2>"$work/host.err" || status=$?
  [ "$status" -eq 1 ] || fail "$label: a faulty description gave exit status $status, expected 1"
  grep -qF "$work/faulty/project.ovp(2) : Path can't end with a trailing slash : \"apps/demo/\"" \
    "$work/host.err" || fail "$label: unexpected error report: $(cat "$work/host.err")"
  echo "$label: ok"
}

echo "== examples/host with find_package(ovMacroExpander)"
# -Werror: the installed headers must compile without warnings in a consumer's build too.
cmake -S examples/host -B "$work/host-build" -DCMAKE_PREFIX_PATH="$prefix" -DCMAKE_CXX_FLAGS=-Werror \
  >"$work/host-configure.log" ||
  { cat "$work/host-configure.log"; fail "configuring examples/host against the installed package failed"; }
cmake --build "$work/host-build" -j"$(nproc)"
check_host "CMake package" "$work/host-build/host"

echo "== examples/host with pkg-config"
export PKG_CONFIG_PATH="$libdir/pkgconfig${PKG_CONFIG_PATH:+:$PKG_CONFIG_PATH}"
[ "$(pkg-config --modversion ovMacroExpander)" = "$version" ] || fail "pkg-config reports another version"
flags=$(pkg-config --cflags --libs ovMacroExpander) || fail "pkg-config --cflags --libs ovMacroExpander failed"
echo "pkg-config --cflags --libs: $flags"
# shellcheck disable=SC2086  # the flags are words to split
"${CXX:-c++}" -std=c++20 -Wall -Wextra -Wpedantic -Werror -o "$work/host-pc" examples/host/host.cc $flags \
  -Wl,-rpath,"$libdir"
check_host "pkg-config" "$work/host-pc"

# check_generate LABEL CMAKE_ARGUMENTS...: builds a copy of examples/generate, then edits its imported file.
check_generate() {
  local label=$1
  shift
  local src=$work/generate-$label build=$work/generate-$label/build
  cp -r examples/generate "$src"
  cmake -S "$src" -B "$build" -DCMAKE_CXX_FLAGS=-Werror "$@" >"$work/generate.log" 2>&1 ||
    { cat "$work/generate.log"; fail "$label: configuring examples/generate failed"; }
  build_generate() {
    cmake --build "$build" -j"$(nproc)" >"$work/generate.log" 2>&1 ||
      { cat "$work/generate.log"; fail "$label: building examples/generate failed"; }
  }
  local header=$build/colors.h out before
  build_generate
  out=$("$build/palette")
  [ "$out" = "release: red green blue" ] || fail "$label: the program printed '$out'"

  before=$(date -r "$header" +%s.%N)
  touch "$src/common/palette.ovm"
  build_generate
  [ "$(date -r "$header" +%s.%N)" != "$before" ] || fail "$label: touching the imported file did not regenerate"
  echo '@def COLORS = [cyan, magenta]' >"$src/common/palette.ovm"
  build_generate
  out=$("$build/palette")
  [ "$out" = "release: cyan magenta" ] || fail "$label: after editing the imported file the program printed '$out'"

  before=$(date -r "$header" +%s.%N)
  build_generate
  [ "$(date -r "$header" +%s.%N)" = "$before" ] || fail "$label: a build without a change regenerated the header"
  ! grep -q 'Generating colors.h' "$work/generate.log" || fail "$label: a build without a change ran ovmacro"
  echo "$label: ok"
}

echo "== examples/generate with ovmacro_generate()"
check_generate make -G "Unix Makefiles" -DCMAKE_PREFIX_PATH="$prefix"
check_generate ninja -G Ninja -DCMAKE_PREFIX_PATH="$prefix"
check_generate source-tree -G Ninja -DOVMACRO_SOURCE_DIR="$root"

echo "install check passed"
