# Flags that every target of the project shares.
add_library(zentara_flags INTERFACE)
target_include_directories(zentara_flags INTERFACE
  ${CMAKE_SOURCE_DIR}/include ${CMAKE_SOURCE_DIR}/src)
# Contraction would let a variant with fused multiply-add differ from the plain arithmetic.
target_compile_options(zentara_flags INTERFACE
  -Wall -Wextra -Wpedantic -Wshadow -Wconversion -Wno-sign-conversion
  $<$<COMPILE_LANGUAGE:CXX>:-Wnon-virtual-dtor>
  -ffp-contract=off -fno-fast-math)
if(ZENTARA_WERROR)
  target_compile_options(zentara_flags INTERFACE -Werror)
endif()
if(CMAKE_CXX_COMPILER_ID MATCHES "Clang")
  target_compile_options(zentara_flags INTERFACE -Wthread-safety)
endif()
if(ZENTARA_SANITIZE)
  target_compile_options(zentara_flags INTERFACE
    -fsanitize=${ZENTARA_SANITIZE} -fno-sanitize-recover=all -fno-omit-frame-pointer)
  if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
    # Instrumented, the compiler's own <regex> is taken for uninitialised.
    target_compile_options(zentara_flags INTERFACE -Wno-maybe-uninitialized)
  endif()
  target_link_options(zentara_flags INTERFACE -fsanitize=${ZENTARA_SANITIZE})
endif()

find_package(Threads REQUIRED)
target_link_libraries(zentara_flags INTERFACE Threads::Threads)

# Sources of a folder and all below it.
function(zentara_sources result folder)
  file(GLOB_RECURSE found CONFIGURE_DEPENDS ${folder}/*.cpp ${folder}/*.h)
  set(${result} ${found} PARENT_SCOPE)
endfunction()

# For a build that answers quickly; every other build shows what a source forgets to include.
function(zentara_precompile target)
  if(ZENTARA_PRECOMPILE)
    target_precompile_headers(${target} PRIVATE
      <algorithm> <array> <atomic> <memory> <mutex> <string> <thread> <vector> ${ARGN})
  endif()
endfunction()
