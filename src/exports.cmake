# Files for the linker from the list of what leaves the library.

# Names of the list as the compilers of this system write them, those of data with a DATA behind them.
function(zentara_read_exports result list)
  set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${list})
  file(STRINGS ${list} names REGEX "^[A-Za-z_]")
  if(WIN32)
    string(REPLACE "<u64>" "y" names "${names}")
  else()
    string(REPLACE "<u64>" "m" names "${names}")
  endif()
  set(${result} ${names} PARENT_SCOPE)
endfunction()

# A module definition file; the tools of other compilers make their import library of it.
function(zentara_write_definitions file names)
  list(JOIN names "\n" lines)
  file(CONFIGURE OUTPUT ${file} CONTENT "LIBRARY zentara.dll\nEXPORTS\n@lines@\n" @ONLY)
endfunction()

# A version script that keeps all other names inside.
function(zentara_write_version_script file names)
  list(TRANSFORM names REPLACE " DATA$" "")
  list(JOIN names ";\n" lines)
  file(CONFIGURE OUTPUT ${file} CONTENT "{\nglobal:\n@lines@;\nlocal:\n*;\n};\n" @ONLY)
endfunction()
