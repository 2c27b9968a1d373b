# Warnings every target of the project is built with.
add_library(ovmacro_warnings INTERFACE)
target_compile_options(ovmacro_warnings INTERFACE -Wall -Wextra -Wpedantic)
