# Debian packages, made by `cpack -G DEB` from a build configured with the
# prefix /usr (the `package` preset), one package per install component:
#   liborvclifn1             the library and its private service libraries
#   liborvclifn-dev          headers, the shared-object link, CMake and
#                            pkg-config files
#   libsqlite3-mod-orvclifn  the SQLite extension
#   orvclifn-tools           the snapshot writer
#   postgresql-15-orvclifn   the PostgreSQL extension
# Each carries the copyright file and changelog that Debian asks of every
# package; those are installed only when a component is installed on its
# own (EXCLUDE_FROM_ALL), so that a plain `cmake --install` doesn't get them.
set(ORV_DEB_MAINTAINER "orvclifn developers <orvclifn@users.noreply.github.com>")
set(ORV_DEB_RELEASE 1)
set(ORV_DEB_VERSION ${PROJECT_VERSION}-${ORV_DEB_RELEASE})

set(ORV_DEB_PACKAGES
  runtime liborvclifn${PROJECT_VERSION_MAJOR}
  dev liborvclifn-dev
  sqlite libsqlite3-mod-orvclifn
  tools orvclifn-tools)
if(TARGET orvclifn_postgres)
  list(APPEND ORV_DEB_PACKAGES postgres postgresql-${ORV_PG_MAJOR}-orvclifn)
endif()

configure_file(${PROJECT_SOURCE_DIR}/packaging/deb/changelog.in
  ${PROJECT_BINARY_DIR}/packaging/changelog.Debian @ONLY)
add_custom_command(OUTPUT ${PROJECT_BINARY_DIR}/packaging/changelog.Debian.gz
  COMMAND gzip -9nkf changelog.Debian
  DEPENDS ${PROJECT_BINARY_DIR}/packaging/changelog.Debian
  WORKING_DIRECTORY ${PROJECT_BINARY_DIR}/packaging VERBATIM)
add_custom_command(OUTPUT ${PROJECT_BINARY_DIR}/packaging/orv_snapshot.1.gz
  COMMAND gzip -9nc ${PROJECT_SOURCE_DIR}/packaging/deb/orv_snapshot.1 > orv_snapshot.1.gz
  DEPENDS ${PROJECT_SOURCE_DIR}/packaging/deb/orv_snapshot.1
  WORKING_DIRECTORY ${PROJECT_BINARY_DIR}/packaging VERBATIM)
add_custom_target(orv_package_docs ALL DEPENDS ${PROJECT_BINARY_DIR}/packaging/changelog.Debian.gz
  ${PROJECT_BINARY_DIR}/packaging/orv_snapshot.1.gz)

set(components)
set(pairs ${ORV_DEB_PACKAGES})
while(pairs)
  list(POP_FRONT pairs component package)
  list(APPEND components ${component})
  string(TOUPPER ${component} upper)
  set(CPACK_DEBIAN_${upper}_PACKAGE_NAME ${package})
  install(FILES ${PROJECT_SOURCE_DIR}/packaging/deb/copyright
    ${PROJECT_BINARY_DIR}/packaging/changelog.Debian.gz
    DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/${package} COMPONENT ${component} EXCLUDE_FROM_ALL)
  configure_file(${PROJECT_SOURCE_DIR}/packaging/deb/lintian-overrides.in
    ${PROJECT_BINARY_DIR}/packaging/overrides/${package} @ONLY)
  install(FILES ${PROJECT_BINARY_DIR}/packaging/overrides/${package}
    DESTINATION ${CMAKE_INSTALL_DATADIR}/lintian/overrides COMPONENT ${component} EXCLUDE_FROM_ALL)
endwhile()
install(FILES ${PROJECT_BINARY_DIR}/packaging/orv_snapshot.1.gz
  DESTINATION ${CMAKE_INSTALL_MANDIR}/man1 COMPONENT tools)

set(CPACK_GENERATOR DEB)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_COMPONENTS_ALL ${components})
set(CPACK_PACKAGE_NAME orvclifn)
set(CPACK_PACKAGE_VENDOR "orvclifn developers")
set(CPACK_PACKAGE_CONTACT ${ORV_DEB_MAINTAINER})
set(CPACK_PACKAGING_INSTALL_PREFIX ${CMAKE_INSTALL_PREFIX})
set(CPACK_STRIP_FILES ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_RELEASE ${ORV_DEB_RELEASE})
set(CPACK_DEBIAN_PACKAGE_MAINTAINER ${ORV_DEB_MAINTAINER})
set(CPACK_DEBIAN_PACKAGE_PRIORITY optional)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
# dpkg-shlibdeps runs in each component's staging folder; the library the
# extension needs is staged beside it, in the runtime component's.
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS ../runtime/${CMAKE_INSTALL_FULL_LIBDIR}
  ../runtime/${CMAKE_INSTALL_FULL_LIBDIR}/orvclifn)
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS ON)
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS_POLICY ">=")

set(runtime liborvclifn${PROJECT_VERSION_MAJOR})
# Each package's description is its own: a synopsis line, then the body.
# An empty shared summary keeps CPack from putting the project's in front.
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "")
set(about "orvclifn is a library of SQL routines that a database engine loads and
calls by name: date and time, numeric, string and phonetic functions that
report their errors under the tag SYSFUN, and table functions that read the
engine's own data.")
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SECTION libs)
set(CPACK_DEBIAN_RUNTIME_DESCRIPTION "SQL routines under the tag SYSFUN - library
${about}

This package holds the shared library and the service libraries it loads.")
# The library is in the loader's folder: ldconfig runs by trigger.
set(CPACK_DEBIAN_RUNTIME_PACKAGE_CONTROL_EXTRA ${PROJECT_SOURCE_DIR}/packaging/deb/triggers)
set(CPACK_POST_BUILD_SCRIPTS ${PROJECT_SOURCE_DIR}/packaging/deb/drop_ldconfig_scripts.cmake)
set(CPACK_DEBIAN_DEV_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEV_PACKAGE_DEPENDS "${runtime} (= ${ORV_DEB_VERSION})")
set(CPACK_DEBIAN_DEV_DESCRIPTION "SQL routines under the tag SYSFUN - development files
${about}

This package holds the C headers that declare every routine and its call
frame, the CMake package (orvclifn::orvclifn) and the pkg-config file.")
set(CPACK_DEBIAN_SQLITE_PACKAGE_SECTION database)
set(CPACK_DEBIAN_SQLITE_PACKAGE_DEPENDS "${runtime} (= ${ORV_DEB_VERSION})")
set(CPACK_DEBIAN_SQLITE_PACKAGE_ENHANCES "sqlite3")
set(CPACK_DEBIAN_SQLITE_DESCRIPTION "SQL routines under the tag SYSFUN - SQLite extension
${about}

This package holds the loadable SQLite extension that makes every routine an
SQL function. The sqlite3 shell loads it with its command .load and the path
/usr/lib/${CMAKE_LIBRARY_ARCHITECTURE}/orvclifn/orvclifn_sqlite.")
set(CPACK_DEBIAN_TOOLS_PACKAGE_SECTION database)
set(CPACK_DEBIAN_TOOLS_DESCRIPTION "SQL routines under the tag SYSFUN - tools
${about}

This package holds orv_snapshot, which writes the statement cache snapshots
that the table function SQLCACHE_SNAPSHOT reads.")
set(CPACK_DEBIAN_POSTGRES_PACKAGE_SECTION database)
set(CPACK_DEBIAN_POSTGRES_PACKAGE_DEPENDS
  "${runtime} (= ${ORV_DEB_VERSION}), postgresql-${ORV_PG_MAJOR}")
set(CPACK_DEBIAN_POSTGRES_DESCRIPTION "SQL routines under the tag SYSFUN - PostgreSQL ${ORV_PG_MAJOR} extension
${about}

This package holds the PostgreSQL extension: CREATE EXTENSION orvclifn puts
every routine into the schema sysfun as an SQL function.")
include(CPack)
