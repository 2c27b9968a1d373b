# ovmacro_generate(): generates a file from a template with ovmacro, as a step of the build.
#
#   ovmacro_generate(TEMPLATE colors.ovm OUTPUT ${CMAKE_CURRENT_BINARY_DIR}/colors.h
#                    [TARGET colors_gen]          a custom target that brings OUTPUT up to date
#                    [ADD_TO app]                 OUTPUT becomes a source of the existing target app
#                    [DEFINES MODE=release ...]   -D NAME=TEXT, or NAME alone (true)
#                    [INCLUDE_DIRS dir ...]       -I DIR, in order
#                    [OPTIONS --line-markers ...] any other ovmacro options
#                    [DEPENDS file ...]           more files whose change reruns the generation
#                    [COMMENT text])
#
# TEMPLATE, INCLUDE_DIRS and DEPENDS are relative to the calling CMakeLists' folder, OUTPUT to its build
# folder (as add_custom_command takes it). ovmacro writes a dependency file beside OUTPUT (OUTPUT.d) that
# names every file the template imports, and the build reads it: Make and Ninja rerun the generation when the
# template, a file it imports, a DEPENDS file or ovmacro itself changes, and not otherwise. OUTPUT is written
# only when the expansion succeeds; an error names the template's file and line.
#
# The file comes with the CMake package (find_package(ovMacroExpander)) and with this project's own build
# (add_subdirectory), which both define the executable target ovMacroExpander::ovmacro.
include_guard(GLOBAL)

# A function runs under the policies in force where it is defined: those of CMake 3.25, whatever the caller
# asks for (DEPFILE paths as Ninja needs them, among others).
cmake_policy(PUSH)
cmake_policy(VERSION 3.25)

function(ovmacro_generate)
  cmake_parse_arguments(PARSE_ARGV 0 arg "" "TEMPLATE;OUTPUT;TARGET;ADD_TO;COMMENT"
    "DEFINES;INCLUDE_DIRS;OPTIONS;DEPENDS")
  if(arg_UNPARSED_ARGUMENTS)
    message(FATAL_ERROR "ovmacro_generate: unknown arguments: ${arg_UNPARSED_ARGUMENTS}")
  endif()
  if(NOT arg_TEMPLATE OR NOT arg_OUTPUT)
    message(FATAL_ERROR "ovmacro_generate: TEMPLATE and OUTPUT are needed")
  endif()
  if(NOT TARGET ovMacroExpander::ovmacro)
    message(FATAL_ERROR "ovmacro_generate: the ovmacro tool is not there (built with OVMACRO_BUILD_TOOL=OFF?)")
  endif()

  # Absolute paths everywhere: the dependency file then names absolute paths too, which every generator
  # reads the same way.
  cmake_path(ABSOLUTE_PATH arg_TEMPLATE BASE_DIRECTORY "${CMAKE_CURRENT_SOURCE_DIR}" NORMALIZE
    OUTPUT_VARIABLE template)
  cmake_path(ABSOLUTE_PATH arg_OUTPUT BASE_DIRECTORY "${CMAKE_CURRENT_BINARY_DIR}" NORMALIZE
    OUTPUT_VARIABLE output)
  set(arguments)
  foreach(define IN LISTS arg_DEFINES)
    list(APPEND arguments -D "${define}")
  endforeach()
  foreach(dir IN LISTS arg_INCLUDE_DIRS)
    cmake_path(ABSOLUTE_PATH dir BASE_DIRECTORY "${CMAKE_CURRENT_SOURCE_DIR}" NORMALIZE)
    list(APPEND arguments -I "${dir}")
  endforeach()
  set(depends)
  foreach(file IN LISTS arg_DEPENDS)
    cmake_path(ABSOLUTE_PATH file BASE_DIRECTORY "${CMAKE_CURRENT_SOURCE_DIR}" NORMALIZE)
    list(APPEND depends "${file}")
  endforeach()
  if(NOT arg_COMMENT)
    cmake_path(GET output FILENAME output_name)
    cmake_path(GET template FILENAME template_name)
    set(arg_COMMENT "Generating ${output_name} from ${template_name}")
  endif()

  add_custom_command(OUTPUT "${output}"
    COMMAND ovMacroExpander::ovmacro ${arguments} ${arg_OPTIONS} --deps "${output}.d" -o "${output}" -- "${template}"
    DEPENDS "${template}" ${depends} "$<TARGET_FILE:ovMacroExpander::ovmacro>"
    DEPFILE "${output}.d"
    COMMENT "${arg_COMMENT}"
    VERBATIM)
  if(arg_TARGET)
    add_custom_target(${arg_TARGET} DEPENDS "${output}")
  endif()
  if(arg_ADD_TO)
    target_sources(${arg_ADD_TO} PRIVATE "${output}")
    # With Make, two targets that both carry the rule could run it at once; the target's order avoids that.
    if(arg_TARGET)
      add_dependencies(${arg_ADD_TO} ${arg_TARGET})
    endif()
  endif()
endfunction()

cmake_policy(POP)
