# SPDX-License-Identifier: Apache-2.0
# How components are compiled: one target each. scripts/check-dependencies.py checks what they include.

find_package(Python3 REQUIRED COMPONENTS Interpreter)

# Flags of everything: floats exactly as written.
add_library(qz_flags INTERFACE)
target_include_directories(qz_flags INTERFACE ${PROJECT_SOURCE_DIR})
target_compile_options(qz_flags INTERFACE -ffp-contract=off -Wall -Wextra -Wshadow -Wundef $<$<BOOL:${QZ_WERROR}>:-Werror>)
if(CMAKE_SYSTEM_PROCESSOR MATCHES "^arm")
  # Nothing built here is linked to what compilers of ten years ago have built.
  target_compile_options(qz_flags INTERFACE -Wno-psabi)
endif()
if(CMAKE_CROSSCOMPILING)
  # The device's build goes without the checks of preconditions.
  target_compile_definitions(qz_flags INTERFACE QZ_WITHOUT_CHECKS)
endif()
if(QZ_SANITIZE STREQUAL "address")
  # vptr checks need RTTI, which the module does without.
  set(sanitizers -fsanitize=address,undefined -fno-sanitize=vptr -fno-sanitize-recover=all)
elseif(QZ_SANITIZE STREQUAL "thread")
  set(sanitizers -fsanitize=thread)
elseif(QZ_SANITIZE)
  message(FATAL_ERROR "QZ_SANITIZE is '${QZ_SANITIZE}', expected address, thread or nothing")
endif()
if(QZ_SANITIZE)
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

# On a PC the kernels choose among their implementations at the first call (kernels/kernel_table.h); elsewhere
# the build does.
if(CMAKE_SYSTEM_PROCESSOR MATCHES "^(x86_64|AMD64)$")
  set(own_kernels x86_64)
else()
  set(own_kernels plain)
endif()
set(QZ_KERNELS ${own_kernels} CACHE STRING
    "Whose kernels: plain (the references, for any processor), neon (AArch32) or x86_64 (a PC's, chosen as they run)")
set_property(CACHE QZ_KERNELS PROPERTY STRINGS plain neon x86_64)

# The instruction sets for which the kernels of this build may have variants.
set(QZ_VARIANT_SETS ${QZ_KERNELS})
if(QZ_KERNELS STREQUAL "x86_64")
  set(QZ_VARIANT_SETS avx2 avx512vnni)
endif()
# g++ 12 vectorises sums of byte products wrongly for these instructions, which a user's flags (-march=native) may
# allow: docs/performance.md. These flags come after the user's.
include(CheckCXXCompilerFlag)
set(QZ_FLAGS_reference)
foreach(extension avx512vnni avxvnni)
  if(CMAKE_SYSTEM_PROCESSOR MATCHES "^(x86_64|AMD64)$")
    check_cxx_compiler_flag(-mno-${extension} QZ_HAS_NO_${extension})
    if(QZ_HAS_NO_${extension})
      list(APPEND QZ_FLAGS_reference -mno-${extension})
    endif()
  endif()
endforeach()
# Never without optimisation: what is inline must not become a function that others could be linked to.
set(QZ_FLAGS_avx2 ${QZ_FLAGS_reference} -mavx2 $<$<CONFIG:Debug>:-O1>)
set(QZ_FLAGS_avx512vnni ${QZ_FLAGS_avx2} -mavx512f -mavx512bw -mavx512vl -mavx512vnni)
set(QZ_FLAGS_reference_avx2 ${QZ_FLAGS_avx2})

# qz_module_component(NAME SOURCES... LINKS... USES...): a component of the module, as a static library. Who links it
# sees the components of LINKS too, which its headers include, but not those of USES.
function(qz_module_component name)
  cmake_parse_arguments(component "" "" "SOURCES;LINKS;USES" ${ARGN})
  add_library(${name} STATIC ${component_SOURCES})
  target_include_directories(${name} PUBLIC ${PROJECT_SOURCE_DIR})
  target_link_libraries(${name} PUBLIC ${component_LINKS} PRIVATE ${component_USES} qz_module_flags)
endfunction()

# qz_kernel_variant(NAME VARIANT SOURCES...): implementations whose names end in __VARIANT (kernels/variant.h), as
# the library NAME_VARIANT.
function(qz_kernel_variant name variant)
  qz_module_component(${name}_${variant} SOURCES ${ARGN} LINKS ${name})
  target_compile_definitions(${name}_${variant} PRIVATE QZ_VARIANT=${variant})
  target_compile_options(${name}_${variant} PRIVATE ${QZ_FLAGS_${variant}})
endfunction()

# qz_kernel_component(NAME REFERENCES names... TABLES sources...): a component of kernels. NAME.cc is a reference
# implementation, and SET/NAME.cc the variant for an instruction set, if there is one, which gives the same bytes.
#
# The library NAME holds what runs in this build, under the kernels' own names: the variants for QZ_KERNELS and the
# references of the other kernels; or on a PC functions that choose. NAME_reference always holds the references,
# under names of their own, for those who compare. The global property QZ_VECTOR_VARIANTS lists SET/NAME of all
# variants in this build.
function(qz_kernel_component name)
  cmake_parse_arguments(component "" "" "REFERENCES;TABLES" ${ARGN})
  list(TRANSFORM component_REFERENCES APPEND .cc OUTPUT_VARIABLE references)
  file(GLOB variants RELATIVE ${CMAKE_CURRENT_SOURCE_DIR} CONFIGURE_DEPENDS */*.cc)
  foreach(variant IN LISTS variants)
    get_filename_component(set ${variant} DIRECTORY)
    get_filename_component(source ${variant} NAME)
    if(NOT source IN_LIST references)
      message(FATAL_ERROR "${name}: ${variant} is a variant of ${source}, which does not exist")
    endif()
    list(APPEND variants_${set} ${variant})
    if(set IN_LIST QZ_VARIANT_SETS)
      string(REGEX REPLACE ".cc$" "" variant ${variant})
      set_property(GLOBAL APPEND PROPERTY QZ_VECTOR_VARIANTS ${variant})
    endif()
  endforeach()

  if(QZ_KERNELS STREQUAL "x86_64")
    qz_module_component(${name} SOURCES ${PROJECT_SOURCE_DIR}/kernels/x86_64/${name}.cc ${component_TABLES})
    qz_kernel_variant(${name} reference_avx2 ${references})
    target_link_libraries(${name} PUBLIC x86_64_processor PRIVATE ${name}_reference ${name}_reference_avx2)
    foreach(set IN LISTS QZ_VARIANT_SETS)
      if(variants_${set})
        qz_kernel_variant(${name} ${set} ${variants_${set}})
        target_link_libraries(${name} PRIVATE ${name}_${set})
      endif()
    endforeach()
  else()
    foreach(source IN LISTS references)
      if(${QZ_KERNELS}/${source} IN_LIST variants)
        list(APPEND running ${QZ_KERNELS}/${source})
      else()
        list(APPEND running ${source})
      endif()
    endforeach()
    qz_module_component(${name} SOURCES ${running} ${component_TABLES})
    target_compile_options(${name} PRIVATE ${QZ_FLAGS_reference})
  endif()
  qz_kernel_variant(${name} reference ${references})
endfunction()

# qz_component(NAME SOURCES... LINKS...): a component of the PC side, as a static library.
function(qz_component name)
  cmake_parse_arguments(component "" "" "SOURCES;LINKS" ${ARGN})
  add_library(${name} STATIC ${component_SOURCES})
  target_include_directories(${name} PUBLIC ${PROJECT_SOURCE_DIR})
  target_link_libraries(${name} PUBLIC ${component_LINKS} PRIVATE qz_flags)
endfunction()

# What `make check` and the build under ThreadSanitizer build.
add_custom_target(unit_tests)
add_custom_target(thread_tests)

# qz_test(NAME SOURCES... LINKS... [STARTS_PROGRAMS] [NEEDS_AVX2] [USES_THREADS]): one suite, run by CTest as one
# test that fails when it holds none; under the label unit unless it STARTS_PROGRAMS, and under threads if it
# USES_THREADS. On a PC it runs once more, under the label without_avx2, on an emulated processor, unless it
# STARTS_PROGRAMS, which would run on this one, or NEEDS_AVX2.
function(qz_test name)
  cmake_parse_arguments(test "STARTS_PROGRAMS;NEEDS_AVX2;USES_THREADS" "" "SOURCES;LINKS" ${ARGN})
  add_executable(${name} ${test_SOURCES})
  target_link_libraries(${name} PRIVATE ${test_LINKS} qz_test_support qz_flags)
  add_test(NAME ${name} COMMAND ${name})
  set_tests_properties(${name} PROPERTIES TIMEOUT 900)
  if(NOT test_STARTS_PROGRAMS)
    set_property(TEST ${name} APPEND PROPERTY LABELS unit)
    add_dependencies(unit_tests ${name})
  endif()
  if(test_USES_THREADS)
    set_property(TEST ${name} APPEND PROPERTY LABELS threads)
    add_dependencies(thread_tests ${name})
  endif()
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
