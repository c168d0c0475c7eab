# Where things are installed, in components that bear the names of the packages. Libraries go where Debian looks for
# them, under /usr/local too: into the folder of the architecture.
set(CMAKE_INSTALL_LIBDIR "lib/${CMAKE_LIBRARY_ARCHITECTURE}" CACHE STRING "Libraries")
include(GNUInstallDirs)
include(CMakePackageConfigHelpers)
set(CMAKE_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS
    OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)

# quorelastic_install_template(FILE DESTINATION COMPONENT): FILE.in with its variables filled in. CMAKE_INSTALL_PREFIX is
# the one that the installation is told, which need not be that of the build; so is what follows from it.
function(quorelastic_install_template file destination component)
  cmake_path(GET file FILENAME name)
  set(made "${PROJECT_BINARY_DIR}/install/${name}.in")
  set(CMAKE_INSTALL_PREFIX "@CMAKE_INSTALL_PREFIX@")
  set(QUORELASTIC_CONFIGURATION "@QUORELASTIC_CONFIGURATION@")
  configure_file("${PROJECT_SOURCE_DIR}/${file}.in" "${made}" @ONLY)
  install(CODE "configure_file(\"${made}\" \"\$ENV{DESTDIR}\${CMAKE_INSTALL_PREFIX}/${destination}/${name}\"
                               @ONLY NO_SOURCE_PERMISSIONS)" COMPONENT ${component})
endfunction()

# quorelastic_install_library(TARGET NAME HEADERS): the library, its folder of headers, and what find_package and
# pkg-config find it by. packaging/cmake and packaging/pkgconfig hold what differs between the libraries.
function(quorelastic_install_library target name headers)
  set(development "lib${name}-dev")
  install(TARGETS ${target} EXPORT ${name}
          LIBRARY DESTINATION "${CMAKE_INSTALL_LIBDIR}" COMPONENT "lib${name}0" NAMELINK_COMPONENT ${development})
  install(DIRECTORY "${PROJECT_SOURCE_DIR}/engine/include/${headers}" DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}"
          COMPONENT ${development} FILES_MATCHING PATTERN "*.h")

  set(folder "${CMAKE_INSTALL_LIBDIR}/cmake/${name}")
  set(made "${PROJECT_BINARY_DIR}/install")
  configure_package_config_file("${PROJECT_SOURCE_DIR}/packaging/cmake/${name}Config.cmake.in"
                                "${made}/${name}Config.cmake" INSTALL_DESTINATION "${folder}"
                                NO_SET_AND_CHECK_MACRO NO_CHECK_REQUIRED_COMPONENTS_MACRO)
  write_basic_package_version_file("${made}/${name}ConfigVersion.cmake" COMPATIBILITY SameMinorVersion)
  install(FILES "${made}/${name}Config.cmake" "${made}/${name}ConfigVersion.cmake" DESTINATION "${folder}"
          COMPONENT ${development})
  install(EXPORT ${name} NAMESPACE ${name}:: FILE ${name}Targets.cmake DESTINATION "${folder}"
          COMPONENT ${development})
  quorelastic_install_template(packaging/pkgconfig/${name}.pc "${CMAKE_INSTALL_LIBDIR}/pkgconfig" ${development})
endfunction()

# quorelastic_install_manual(COMPONENT PAGE): a manual page of docs/man.
function(quorelastic_install_manual component page)
  string(REGEX REPLACE ".*\\." "" section ${page})
  install(FILES "${PROJECT_SOURCE_DIR}/docs/man/${page}" DESTINATION "${CMAKE_INSTALL_MANDIR}/man${section}"
          COMPONENT ${component})
endfunction()
quorelastic_install_manual(quorelastic quorelastic.8)
quorelastic_install_manual(quorelasticd quorelasticd.8)
quorelastic_install_manual(quorelasticd quorelastic-protocol.7)
quorelastic_install_manual(libquorelastic-dev libquorelastic.3)
install(FILES packaging/completion/quorelastic
        DESTINATION "${CMAKE_INSTALL_DATADIR}/bash-completion/completions" COMPONENT quorelastic)

# The service. systemd looks into the prefixes /usr and /usr/local alike. Its configuration stays as it is where there is
# one already.
install(CODE "if(CMAKE_INSTALL_PREFIX STREQUAL \"/usr\")
  set(QUORELASTIC_CONFIGURATION /etc)
else()
  set(QUORELASTIC_CONFIGURATION \"\${CMAKE_INSTALL_PREFIX}/etc\")
endif()
if(NOT EXISTS \"\$ENV{DESTDIR}\${QUORELASTIC_CONFIGURATION}/default/quorelasticd\")
  file(INSTALL \"${PROJECT_SOURCE_DIR}/packaging/systemd/quorelasticd.default\" TYPE FILE RENAME quorelasticd
       DESTINATION \"\${QUORELASTIC_CONFIGURATION}/default\")
endif()" COMPONENT quorelasticd)
quorelastic_install_template(packaging/systemd/quorelasticd.service lib/systemd/system quorelasticd)
install(FILES packaging/systemd/quorelasticd.socket DESTINATION lib/systemd/system COMPONENT quorelasticd)
install(FILES packaging/systemd/sysusers.conf DESTINATION lib/sysusers.d RENAME quorelasticd.conf
        COMPONENT quorelasticd)
install(FILES packaging/systemd/tmpfiles.conf DESTINATION lib/tmpfiles.d RENAME quorelasticd.conf
        COMPONENT quorelasticd)

install(FILES docs/protocol.md docs/index-format.md DESTINATION "${CMAKE_INSTALL_DATADIR}/doc/quorelasticd"
        COMPONENT quorelasticd)
install(DIRECTORY examples/engine/ DESTINATION "${CMAKE_INSTALL_DATADIR}/doc/libquorelastic-dev/examples"
        COMPONENT libquorelastic-dev)
install(DIRECTORY examples/quordaemon/ DESTINATION "${CMAKE_INSTALL_DATADIR}/doc/libquordaemon-dev/examples"
        COMPONENT libquordaemon-dev)
