# GoogleTest and GoogleMock as GTest::gtest, GTest::gtest_main and GTest::gmock. For a system for which no package is
# made, the sources that the host's package brings are compiled.
if(NOT WIN32)
  find_package(GTest REQUIRED)
  return()
endif()
set(INSTALL_GTEST OFF)
add_subdirectory(/usr/src/googletest ${CMAKE_BINARY_DIR}/googletest EXCLUDE_FROM_ALL)
foreach(name gtest gtest_main gmock)
  target_compile_options(${name} PRIVATE -w)
  if(NOT TARGET GTest::${name})
    add_library(GTest::${name} ALIAS ${name})
  endif()
endforeach()
