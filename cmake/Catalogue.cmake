# Reads the catalogue's rows that this build has (Built::yes) and writes the
# linker's list of exports from them: those routines and the data export,
# nothing else.  On Linux the list is a version script, on Windows a module
# definition (.def) file.
set(ORV_CATALOGUE ${PROJECT_SOURCE_DIR}/src/catalogue/catalogue.hpp)
set_property(DIRECTORY ${PROJECT_SOURCE_DIR} APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${ORV_CATALOGUE})

function(orv_built_exports out_var)
  # A row may hold semicolons in its text; only the piece that opens a row
  # matches the pattern, so splitting on them does no harm.
  file(STRINGS ${ORV_CATALOGUE} pieces REGEX "^[ \t]*{\"[A-Za-z0-9_]+\", Built::yes,")
  set(names "")
  foreach(piece IN LISTS pieces)
    if(piece MATCHES "^[ \t]*{\"([A-Za-z0-9_]+)\", Built::yes,")
      list(APPEND names ${CMAKE_MATCH_1})
    endif()
  endforeach()
  set(${out_var} ${names} PARENT_SCOPE)
endfunction()

# Writes an anonymous version script: the listed names global, all else local.
function(orv_write_version_script path)
  orv_built_exports(names)
  set(body "{\n  global:\n    sqlzThisIsAORVLibrary;\n")
  foreach(name IN LISTS names)
    string(APPEND body "    ${name};\n")
  endforeach()
  string(APPEND body "  local:\n    *;\n};\n")
  file(CONFIGURE OUTPUT ${path} CONTENT "${body}" @ONLY)
endfunction()

# Writes a module definition file: the listed names exported undecorated,
# the data export marked DATA so that it is exported as data, not code.
# No LIBRARY line: the linker takes the name of the file it writes.
function(orv_write_module_definition path)
  orv_built_exports(names)
  set(body "EXPORTS\n    sqlzThisIsAORVLibrary DATA\n")
  foreach(name IN LISTS names)
    string(APPEND body "    ${name}\n")
  endforeach()
  file(CONFIGURE OUTPUT ${path} CONTENT "${body}" @ONLY)
endfunction()
