# In a cross build, the programs that the build itself runs (orv_generate)
# are built for the machine that runs the build, not for the target: by a
# native build of this same source tree with ORV_BUILD_TOOLS_ONLY, in the
# folder `native` of the cross build, made and brought up to date as a step
# of the cross build.  Each is imported under its usual target name, so that
# a custom command names it as it would name a target built here.
include(ExternalProject)

set(ORV_NATIVE_DIR ${CMAKE_BINARY_DIR}/native)
set(ORV_NATIVE_TOOLS orv_generate)

set(products)
foreach(tool IN LISTS ORV_NATIVE_TOOLS)
  list(APPEND products ${ORV_NATIVE_DIR}/bin/${tool}${CMAKE_HOST_EXECUTABLE_SUFFIX})
endforeach()
# The native compiler is the one the build machine's CMake finds by itself:
# nothing of the cross toolchain is handed down.  The native build is run
# every time (it has its own dependency checks), and its programs are named
# as its products so that what they write is redone only when one changes.
ExternalProject_Add(orv_native_tools
  SOURCE_DIR ${PROJECT_SOURCE_DIR}
  BINARY_DIR ${ORV_NATIVE_DIR}
  CMAKE_ARGS -DCMAKE_BUILD_TYPE=Release -DORV_BUILD_TOOLS_ONLY=ON
  BUILD_COMMAND ${CMAKE_COMMAND} --build . --target ${ORV_NATIVE_TOOLS}
  BUILD_ALWAYS ON
  BUILD_BYPRODUCTS ${products}
  INSTALL_COMMAND "")

foreach(tool product IN ZIP_LISTS ORV_NATIVE_TOOLS products)
  add_executable(${tool} IMPORTED GLOBAL)
  set_target_properties(${tool} PROPERTIES IMPORTED_LOCATION ${product})
  add_dependencies(${tool} orv_native_tools)
endforeach()
