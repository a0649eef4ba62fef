# What `cmake --install` puts where (Linux):
#   lib/liborvclifn.so.1.0.0 and its SONAME links   the library
#   lib/orvclifn/libORV*64.so                       the engine's service libraries
#                                                   (the stand-ins), private to the
#                                                   library so that they never shadow
#                                                   an engine's own
#   lib/orvclifn/orvclifn_sqlite.so                 the SQLite extension
#   bin/orv_snapshot                                the snapshot writer
#   include/orvclifn/cliudf.h, orvclifn.h           the frame and every export
#   lib/cmake/orvclifn/, lib/pkgconfig/orvclifn.pc  for builders
# Every RUNPATH is relative ($ORIGIN), so an installed tree works wherever
# it is put; DESTDIR staging works as usual.
include(GNUInstallDirs)
include(CMakePackageConfigHelpers)

set(ORV_PRIVATE_LIBDIR ${CMAKE_INSTALL_LIBDIR}/orvclifn)
set(ORV_HEADERS_DIR ${CMAKE_INSTALL_INCLUDEDIR}/orvclifn)

set_target_properties(orvclifn PROPERTIES INSTALL_RPATH "$ORIGIN/orvclifn")
set_target_properties(ORVSYS64 ORVAPP64 ORVG11N64 PROPERTIES INSTALL_RPATH "$ORIGIN")
target_include_directories(orvclifn INTERFACE $<INSTALL_INTERFACE:${ORV_HEADERS_DIR}>)

# Shared objects are read, not run: no execute bit, as Debian has it.
set(ORV_SHARED_OBJECT_PERMISSIONS OWNER_READ OWNER_WRITE GROUP_READ WORLD_READ)

install(TARGETS orvclifn EXPORT orvclifnTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} PERMISSIONS ${ORV_SHARED_OBJECT_PERMISSIONS}
          COMPONENT runtime NAMELINK_COMPONENT dev)
install(TARGETS ORVSYS64 ORVAPP64 ORVG11N64 EXPORT orvclifnTargets
  LIBRARY DESTINATION ${ORV_PRIVATE_LIBDIR} PERMISSIONS ${ORV_SHARED_OBJECT_PERMISSIONS}
          COMPONENT runtime NAMELINK_SKIP)
install(FILES ${PROJECT_SOURCE_DIR}/src/frame/cliudf.h ${PROJECT_BINARY_DIR}/src/generated/orvclifn.h
  DESTINATION ${ORV_HEADERS_DIR} COMPONENT dev)

if(TARGET orvclifn_sqlite)
  # Beside the service libraries; the library itself is one folder up.
  set_target_properties(orvclifn_sqlite PROPERTIES INSTALL_RPATH "$ORIGIN/..:$ORIGIN")
  install(TARGETS orvclifn_sqlite LIBRARY DESTINATION ${ORV_PRIVATE_LIBDIR}
          PERMISSIONS ${ORV_SHARED_OBJECT_PERMISSIONS} COMPONENT sqlite)
endif()
if(TARGET orvclifn_postgres)
  # In PostgreSQL's folders, found by the server as $libdir/orvclifn; the
  # library is reached from there by a path relative to the module.
  # In the loader's own folders (a /usr install) it needs no search path.
  if(NOT CMAKE_INSTALL_FULL_LIBDIR IN_LIST CMAKE_CXX_IMPLICIT_LINK_DIRECTORIES)
    file(RELATIVE_PATH to_library ${CMAKE_INSTALL_PREFIX}/${ORV_PG_LIBDIR} ${CMAKE_INSTALL_FULL_LIBDIR})
    set_target_properties(orvclifn_postgres PROPERTIES INSTALL_RPATH "$ORIGIN/${to_library}")
  endif()
  install(TARGETS orvclifn_postgres LIBRARY DESTINATION ${ORV_PG_LIBDIR}
          PERMISSIONS ${ORV_SHARED_OBJECT_PERMISSIONS} COMPONENT postgres)
  install(FILES ${ORV_PG_FILES} DESTINATION ${ORV_PG_EXTENSIONDIR} COMPONENT postgres)
endif()
if(TARGET orv_snapshot)
  install(TARGETS orv_snapshot RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT tools)
endif()

# find_package(orvclifn CONFIG) gives orvclifn::orvclifn.
set(ORV_CMAKE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/orvclifn)
install(EXPORT orvclifnTargets NAMESPACE orvclifn:: DESTINATION ${ORV_CMAKE_DIR} COMPONENT dev)
configure_package_config_file(${CMAKE_CURRENT_LIST_DIR}/orvclifnConfig.cmake.in
  ${PROJECT_BINARY_DIR}/orvclifnConfig.cmake INSTALL_DESTINATION ${ORV_CMAKE_DIR})
write_basic_package_version_file(${PROJECT_BINARY_DIR}/orvclifnConfigVersion.cmake
  COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/orvclifnConfig.cmake
  ${PROJECT_BINARY_DIR}/orvclifnConfigVersion.cmake DESTINATION ${ORV_CMAKE_DIR} COMPONENT dev)

# pkg-config orvclifn, with paths relative to the file so that a moved
# tree still answers.
file(RELATIVE_PATH ORV_PC_TO_PREFIX ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig ${CMAKE_INSTALL_PREFIX})
string(REGEX REPLACE "/$" "" ORV_PC_TO_PREFIX "${ORV_PC_TO_PREFIX}")
configure_file(${CMAKE_CURRENT_LIST_DIR}/orvclifn.pc.in ${PROJECT_BINARY_DIR}/orvclifn.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/orvclifn.pc
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig COMPONENT dev)
