# How the rooms of the house are compiled: one target per room, and the include path of a target holds
# only its own folder and the rooms it links, so that an include against the order fails to compile.

find_package(Python3 REQUIRED COMPONENTS Interpreter)

# Flags of everything: floats exactly as written, no warning let through.
add_library(qz_flags INTERFACE)
target_compile_options(qz_flags INTERFACE -ffp-contract=off -Wall -Wextra -Wshadow -Wundef -Werror)
if(CMAKE_SYSTEM_PROCESSOR MATCHES "^arm")
  # Nothing built here meets what compilers of ten years ago have built.
  target_compile_options(qz_flags INTERFACE -Wno-psabi)
endif()
if(QZ_SANITIZE)
  # vptr checks need RTTI, which the module does without.
  set(sanitizers -fsanitize=address,undefined -fno-sanitize=vptr -fno-sanitize-recover=all)
  target_compile_options(qz_flags INTERFACE ${sanitizers} -fno-omit-frame-pointer)
  target_link_options(qz_flags INTERFACE ${sanitizers})
endif()

# Flags of the module: as on the device. errno of sqrt and stack protectors would be imports.
add_library(qz_module_flags INTERFACE)
target_link_libraries(qz_module_flags INTERFACE qz_flags)
target_compile_options(
  qz_module_flags
  INTERFACE -fvisibility=hidden -fno-stack-protector -U_FORTIFY_SOURCE -fno-math-errno
            -fno-asynchronous-unwind-tables
            $<$<COMPILE_LANGUAGE:CXX>:-fno-exceptions -fno-rtti -fno-threadsafe-statics>)
if(CMAKE_CROSSCOMPILING AND CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
  # Each function's stack and calls, in a file beside the object, for scripts/footprint.
  target_compile_options(qz_module_flags INTERFACE -fcallgraph-info=su)
endif()

set(QZ_KERNELS plain CACHE STRING "Whose kernels: plain (any processor's) or neon (AArch32)")
set_property(CACHE QZ_KERNELS PROPERTY STRINGS plain neon)

# qz_module_room(NAME SOURCES... LINKS... USES...): a room of the module, as a static library. Who links it
# sees the rooms of LINKS too, which its headers include, but not those of USES.
function(qz_module_room name)
  cmake_parse_arguments(room "" "" "SOURCES;LINKS;USES" ${ARGN})
  add_library(${name} STATIC ${room_SOURCES})
  target_include_directories(${name} PUBLIC ${CMAKE_CURRENT_SOURCE_DIR})
  target_link_libraries(${name} PUBLIC ${room_LINKS} PRIVATE ${room_USES} qz_module_flags)
endfunction()

# qz_kernel_room(NAME TEXTS rows... TABLES sources...): a room of kernels. A row names a text, NAME.cc,
# and then the processors for which there is another, PROCESSOR/NAME.cc, that gives the same bytes.
# Two libraries: NAME holds what runs in this build (its property VECTOR_TEXTS lists the texts that are
# not plain); NAME_plain holds the plain texts, always, under names with __plain behind them, for those
# who compare.
function(qz_kernel_room name)
  cmake_parse_arguments(room "" "" "TEXTS;TABLES" ${ARGN})
  file(GLOB unnamed RELATIVE ${CMAKE_CURRENT_SOURCE_DIR} */*.cc)
  foreach(row IN LISTS room_TEXTS)
    separate_arguments(processors UNIX_COMMAND "${row}")
    list(POP_FRONT processors text)
    foreach(processor IN LISTS processors)
      if(NOT ${processor}/${text}.cc IN_LIST unnamed)
        message(FATAL_ERROR "${name}: the row '${row}' names ${processor}/${text}.cc, which does not exist")
      endif()
      list(REMOVE_ITEM unnamed ${processor}/${text}.cc)
    endforeach()
    list(APPEND plain ${text}.cc)
    if(QZ_KERNELS IN_LIST processors)
      list(APPEND running ${QZ_KERNELS}/${text}.cc)
      list(APPEND vector_texts ${text})
    else()
      list(APPEND running ${text}.cc)
    endif()
  endforeach()
  if(unnamed)
    message(FATAL_ERROR "${name}: no row names ${unnamed}")
  endif()
  qz_module_room(${name} SOURCES ${running} ${room_TABLES})
  set_property(TARGET ${name} PROPERTY VECTOR_TEXTS "${vector_texts}")
  qz_module_room(${name}_plain SOURCES ${plain} LINKS ${name})
  target_compile_options(${name}_plain PRIVATE "SHELL:-include \"${CMAKE_SOURCE_DIR}/kernels/plain_names.h\"")
endfunction()

# qz_room(NAME SOURCES... LINKS...): a room of the PC side, as a static library.
function(qz_room name)
  cmake_parse_arguments(room "" "" "SOURCES;LINKS" ${ARGN})
  add_library(${name} STATIC ${room_SOURCES})
  target_include_directories(${name} PUBLIC ${CMAKE_CURRENT_SOURCE_DIR})
  target_link_libraries(${name} PUBLIC ${room_LINKS} PRIVATE qz_flags)
endfunction()

# qz_test(NAME SOURCES... LINKS...): one suite, run by CTest as one test that fails when it holds none.
function(qz_test name)
  cmake_parse_arguments(test "" "" "SOURCES;LINKS" ${ARGN})
  add_executable(${name} ${test_SOURCES})
  target_link_libraries(${name} PRIVATE ${test_LINKS} qz_test_support qz_flags)
  add_test(NAME ${name} COMMAND ${name})
  set_tests_properties(${name} PROPERTIES TIMEOUT 900)
endfunction()
