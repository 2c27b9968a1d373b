# Shared by the benchmark scripts (sourced, from the project root).

# Builds ovmacro in Release into build/bench and sets $ovmacro to it.
build_release_ovmacro() {
  cmake -S . -B build/bench -DCMAKE_BUILD_TYPE=Release -DOVMACRO_BUILD_TESTS=OFF -DOVMACRO_BUILD_BENCHMARKS=OFF \
    >/dev/null
  cmake --build build/bench -j"$(nproc)" --target ovmacro >/dev/null
  ovmacro=$PWD/build/bench/tools/ovmacro/ovmacro
}

# write_call_lines N: the lines "x greet(aN, b) y" for 1..N, on standard output.
write_call_lines() {
  seq "$1" | sed 's/.*/x greet(a&, b) y/'
}

# The definition the call lines use, in ovmacro's language.
readonly greet_definition='@def greet(a, b) = {Hello a and b!}'
