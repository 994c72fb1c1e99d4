# How the components of the house are compiled: one target per component, and the include path of a target holds
# only its own folder and the components it links, so that an include against the order fails to compile.

find_package(Python3 REQUIRED COMPONENTS Interpreter)

# Flags of everything: floats exactly as written, no warning let through.
add_library(qz_flags INTERFACE)
target_include_directories(qz_flags INTERFACE ${PROJECT_SOURCE_DIR})
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
  # Each function's stack frame, in a file beside the object, for scripts/footprint.
  target_compile_options(qz_module_flags INTERFACE -fstack-usage)
endif()

# On a PC the loader chooses among texts for its processors (kernels/x86_64/choices.h); elsewhere the
# build does.
if(CMAKE_SYSTEM_PROCESSOR MATCHES "^(x86_64|AMD64)$")
  set(own_kernels x86_64)
else()
  set(own_kernels plain)
endif()
set(QZ_KERNELS ${own_kernels} CACHE STRING
    "Whose kernels: plain (any processor's), neon (AArch32) or x86_64 (a PC's, chosen by the loader)")
set_property(CACHE QZ_KERNELS PROPERTY STRINGS plain neon x86_64)

# The instruction sets for which the kernels of this build may have texts of their own.
set(QZ_TEXT_SETS ${QZ_KERNELS})
if(QZ_KERNELS STREQUAL "x86_64")
  set(QZ_TEXT_SETS avx2 avx512vnni)
endif()
# Never without optimisation: what is inline must not become a function that others could be linked to.
set(QZ_FLAGS_avx2 -mavx2 $<$<CONFIG:Debug>:-O1>)
set(QZ_FLAGS_avx512vnni ${QZ_FLAGS_avx2} -mavx512f -mavx512bw -mavx512vl -mavx512vnni)

# qz_module_component(NAME SOURCES... LINKS... USES...): a component of the module, as a static library. Who links it
# sees the components of LINKS too, which its headers include, but not those of USES.
function(qz_module_component name)
  cmake_parse_arguments(component "" "" "SOURCES;LINKS;USES" ${ARGN})
  add_library(${name} STATIC ${component_SOURCES})
  target_include_directories(${name} PUBLIC ${PROJECT_SOURCE_DIR})
  target_link_libraries(${name} PUBLIC ${component_LINKS} PRIVATE ${component_USES} qz_module_flags)
endfunction()

# qz_kernel_texts(NAME SET SOURCES...): texts under names with __SET behind them, as a library.
function(qz_kernel_texts name set)
  qz_module_component(${name}_${set} SOURCES ${ARGN} LINKS ${name})
  target_compile_options(
    ${name}_${set}
    PRIVATE "SHELL:-D \"QZ_TEXT(kernel)=kernel##__${set}\""
            "SHELL:-include \"${PROJECT_SOURCE_DIR}/kernels/variant_names.h\"")
endfunction()

# qz_kernel_component(NAME TEXTS rows... TABLES sources...): a component of kernels. A row names a text, NAME.cc,
# and then the instruction sets for which there is another, SET/NAME.cc, that gives the same bytes.
#
# The library NAME holds what runs in this build, under the kernels' own names: those of QZ_KERNELS, else
# the plain texts; or on a PC the choice among NAME_plain, NAME_avx2 and NAME_avx512vnni. NAME_plain holds the
# plain texts, always, under names of their own, for those who compare. The global property QZ_VECTOR_TEXTS
# lists SET/NAME of all texts that are not plain.
function(qz_kernel_component name)
  cmake_parse_arguments(component "" "" "TEXTS;TABLES" ${ARGN})
  file(GLOB unnamed RELATIVE ${CMAKE_CURRENT_SOURCE_DIR} */*.cc)
  foreach(row IN LISTS component_TEXTS)
    separate_arguments(sets UNIX_COMMAND "${row}")
    list(POP_FRONT sets text)
    list(APPEND plain ${text}.cc)
    foreach(set IN LISTS sets)
      if(NOT ${set}/${text}.cc IN_LIST unnamed)
        message(FATAL_ERROR "${name}: the row '${row}' names ${set}/${text}.cc, which does not exist")
      endif()
      list(REMOVE_ITEM unnamed ${set}/${text}.cc)
      list(APPEND texts_${set} ${set}/${text}.cc)
      if(set IN_LIST QZ_TEXT_SETS)
        list(APPEND vector_texts ${set}/${text})
      endif()
    endforeach()
    foreach(set ${QZ_KERNELS} avx2)
      if(set IN_LIST sets)
        list(APPEND all_${set} ${set}/${text}.cc)
      else()
        list(APPEND all_${set} ${text}.cc)
      endif()
    endforeach()
  endforeach()
  if(unnamed)
    message(FATAL_ERROR "${name}: no row names ${unnamed}")
  endif()

  if(QZ_KERNELS STREQUAL "x86_64")
    # kernels/x86_64/signal_choice.cc of signal_kernels, and so on. Called by the loader, before
    # sanitizers are ready.
    string(REPLACE _kernels _choice choice ${PROJECT_SOURCE_DIR}/kernels/x86_64/${name}.cc)
    set_source_files_properties(${choice} PROPERTIES COMPILE_OPTIONS -fno-sanitize=all)
    qz_module_component(${name} SOURCES ${choice} ${component_TABLES})
    qz_kernel_texts(${name} avx2 ${all_avx2})
    target_compile_options(${name}_avx2 PRIVATE ${QZ_FLAGS_avx2})
    target_link_libraries(${name} PUBLIC x86_64_processor PRIVATE ${name}_plain ${name}_avx2)
    if(texts_avx512vnni)
      qz_kernel_texts(${name} avx512vnni ${texts_avx512vnni})
      target_compile_options(${name}_avx512vnni PRIVATE ${QZ_FLAGS_avx512vnni})
      target_link_libraries(${name} PRIVATE ${name}_avx512vnni)
    endif()
  else()
    qz_module_component(${name} SOURCES ${all_${QZ_KERNELS}} ${component_TABLES})
  endif()
  set_property(GLOBAL APPEND PROPERTY QZ_VECTOR_TEXTS ${vector_texts})
  qz_kernel_texts(${name} plain ${plain})
endfunction()

# qz_component(NAME SOURCES... LINKS...): a component of the PC side, as a static library.
function(qz_component name)
  cmake_parse_arguments(component "" "" "SOURCES;LINKS" ${ARGN})
  add_library(${name} STATIC ${component_SOURCES})
  target_include_directories(${name} PUBLIC ${PROJECT_SOURCE_DIR})
  target_link_libraries(${name} PUBLIC ${component_LINKS} PRIVATE qz_flags)
endfunction()

# qz_test(NAME SOURCES... LINKS... [STARTS_PROGRAMS] [NEEDS_AVX2]): one suite, run by CTest as one test that
# fails when it holds none. On a PC it runs once more, under the label without_avx2, on an emulated processor;
# not so where it STARTS_PROGRAMS, which would run on this one, or NEEDS_AVX2.
function(qz_test name)
  cmake_parse_arguments(test "STARTS_PROGRAMS;NEEDS_AVX2" "" "SOURCES;LINKS" ${ARGN})
  add_executable(${name} ${test_SOURCES})
  target_link_libraries(${name} PRIVATE ${test_LINKS} qz_test_support qz_flags)
  add_test(NAME ${name} COMMAND ${name})
  set_tests_properties(${name} PROPERTIES TIMEOUT 900)
  if(NOT test_STARTS_PROGRAMS AND NOT test_NEEDS_AVX2)
    qz_test_without_avx2(${name}_without_avx2 $<TARGET_FILE:${name}>)
  endif()
endfunction()

# qz_test_without_avx2(NAME COMMAND...): a test on an emulated x86-64 processor of 2008.
function(qz_test_without_avx2 name)
  if(NOT QZ_KERNELS STREQUAL "x86_64" OR QZ_SANITIZE)
    return()
  endif()
  add_test(NAME ${name} COMMAND qemu-x86_64 -cpu Nehalem ${ARGN})
  set_tests_properties(${name} PROPERTIES TIMEOUT 900 LABELS without_avx2)
endfunction()
