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
# Where sources are joined, what is private to one may meet the like of another.
set(isJoined $<BOOL:$<TARGET_PROPERTY:UNITY_BUILD>>)
target_compile_options(zentara_flags INTERFACE $<${isJoined}:-Wno-shadow>
  $<$<AND:${isJoined},$<COMPILE_LANG_AND_ID:CXX,GNU>>:-Wno-subobject-linkage>)
if(ZENTARA_SANITIZE)
  # A target that only tests others (ZENTARA_IS_SUITE) is watched for its memory and threads, not for its arithmetic,
  # whose checks double the time that its sources take to compile.
  string(REGEX REPLACE ",?undefined" "" suiteSanitizers "${ZENTARA_SANITIZE}")
  set(isSuite $<BOOL:$<TARGET_PROPERTY:ZENTARA_IS_SUITE>>)
  target_compile_options(zentara_flags INTERFACE
    $<$<NOT:${isSuite}>:-fsanitize=${ZENTARA_SANITIZE}>
    $<${isSuite}:-fsanitize=${suiteSanitizers}>
    -fno-sanitize-recover=all -fno-omit-frame-pointer)
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

# Sources that are compiled by themselves in a joined build too, since another has the same private names.
function(zentara_compile_alone)
  set_source_files_properties(${ARGN} PROPERTIES SKIP_UNITY_BUILD_INCLUSION ON)
endfunction()

# What the compiler's guards of the stack call is a library of its own on Windows.
set(zentara_guards)
if(WIN32 AND NOT ZENTARA_SANITIZE)
  set(zentara_guards ssp)
endif()

# The sources of what is shipped: a table or a text that is overrun ends the process. The sanitizers have checks of their
# own. scripts/check-hardening looks at this and at the files.
function(zentara_harden_sources target)
  if(ZENTARA_SANITIZE)
    return()
  endif()
  target_compile_options(${target} PRIVATE -fstack-protector-strong -fcf-protection=full)
  if(NOT WIN32)
    target_compile_options(${target} PRIVATE -fstack-clash-protection)
  endif()
  string(TOUPPER "${CMAKE_BUILD_TYPE}" buildType)
  if("${CMAKE_CXX_FLAGS_${buildType}}" MATCHES "-O[123s]")
    target_compile_options(${target} PRIVATE -U_FORTIFY_SOURCE -D_FORTIFY_SOURCE=2)
  endif()
endfunction()

# How the system loads a library or a program: anywhere, its code never writable, its tables of addresses written once.
# It finds the other libraries beside it, never in a folder of the machine that built it.
function(zentara_harden_image target)
  if(WIN32)
    target_link_options(${target} PRIVATE
      LINKER:--dynamicbase,--high-entropy-va,--nxcompat,--enable-reloc-section)
    target_link_libraries(${target} PRIVATE ${zentara_guards})
    return()
  endif()
  target_link_options(${target} PRIVATE LINKER:-z,relro,-z,now,-z,noexecstack)
  get_target_property(type ${target} TYPE)
  if(type STREQUAL "EXECUTABLE")
    target_link_options(${target} PRIVATE -pie)
  endif()
  set_target_properties(${target} PROPERTIES BUILD_RPATH_USE_ORIGIN ON)
endfunction()
