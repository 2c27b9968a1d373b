# Warnings every target of the project is built with.
add_library(ovmacro_warnings INTERFACE)
target_compile_options(ovmacro_warnings INTERFACE -Wall -Wextra -Wpedantic)
# GCC 12 reports -Wrestrict inside libstdc++'s own std::string concatenation when optimising (a known false
# positive of that release, GCC bug 105329); it says nothing about this project's code.
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU" AND CMAKE_CXX_COMPILER_VERSION VERSION_LESS 13)
  target_compile_options(ovmacro_warnings INTERFACE -Wno-restrict)
endif()
